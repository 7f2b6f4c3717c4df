#include "Platform.h"
#include "fake/FakeHost.h"

#include <QGuiApplication>
#include <QOpenGLWindow>

namespace scripted {

namespace {

struct Window {
    ~Window() { host().resourceWindow = nullptr; }

    int argumentCount = 0;
    QGuiApplication application{argumentCount, nullptr};
    QOpenGLWindow window;
};

} // namespace

std::shared_ptr<void> makeResourceWindow()
{
    setEnvironment("QT_QPA_PLATFORM", "offscreen");
    const auto window = std::make_shared<Window>();
    host().resourceWindow = &window->window;
    return window;
}

} // namespace scripted
