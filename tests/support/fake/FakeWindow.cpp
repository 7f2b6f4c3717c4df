#include "Platform.h"
#include "fake/FakeHost.h"

#include <QGuiApplication>
#include <QOpenGLWindow>

namespace scripted {

namespace {

struct Window {
    int argumentCount = 0;
    QGuiApplication application{argumentCount, nullptr};
    QOpenGLWindow window;
};

} // namespace

ResourceWindow::ResourceWindow()
{
    setEnvironment("QT_QPA_PLATFORM", "offscreen");
    const auto window = std::make_shared<Window>();
    host().resourceWindow = &window->window;
    fWindow = window;
}

} // namespace scripted
