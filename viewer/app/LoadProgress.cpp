#include "viewer/app/LoadProgress.h"

#include "viewer/system/Interrupt.h"

#include <cstdio>
#include <utility>

#include <QGuiApplication>
#include <QWindow>

namespace viewer {
namespace {

constexpr char kTitle[] = "vyra-viewer";
// Seconds between lines on standard error, after the first line at one second.
constexpr int kLinePeriod = 5;

} // namespace

LoadProgress::LoadProgress(QWindow& window, std::string model)
    : fWindow(window), fModel(std::move(model))
{
}

LoadProgress::~LoadProgress()
{
    fWindow.setTitle(kTitle);
}

bool LoadProgress::show(int seconds)
{
    if (seconds > fShown) {
        fShown = seconds;
        const std::string text =
            "loading '" + fModel + "', " + std::to_string(seconds) + " s so far";
        fWindow.setTitle(QString::fromStdString(std::string(kTitle) + ": " + text));
        if (seconds == 1 || seconds % kLinePeriod == 0)
            std::fprintf(stderr, "%s: %s\n", kTitle, text.c_str());
    }
    QGuiApplication::processEvents();
    return fWindow.isVisible() && !interrupted();
}

} // namespace viewer
