#include "Platform.h"
#include "fake/FakeHost.h"

#include <QGuiApplication>
#include <QOpenGLWindow>

namespace scripted {

struct ResourceWindow::Window {
    int argumentCount = 0;
    QGuiApplication application{argumentCount, nullptr};
    QOpenGLWindow window;
};

ResourceWindow::ResourceWindow()
{
    setEnvironment("QT_QPA_PLATFORM", "offscreen");
    fWindow = std::make_unique<Window>();
    host().resourceWindow = &fWindow->window;
}

ResourceWindow::~ResourceWindow()
{
    host().resourceWindow = nullptr;
}

} // namespace scripted
