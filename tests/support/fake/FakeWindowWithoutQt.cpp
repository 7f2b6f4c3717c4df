// The resource window without Qt: an address that is never dereferenced, because the one function
// that the library calls on it is defined here.
#include "fake/FakeHost.h"

namespace scripted {

struct ResourceWindow::Window {
    void* opaque = nullptr;
};

ResourceWindow::ResourceWindow() : fWindow(std::make_unique<Window>())
{
    host().resourceWindow = reinterpret_cast<QOpenGLWindow*>(fWindow.get());
}

ResourceWindow::~ResourceWindow()
{
    host().resourceWindow = nullptr;
}

} // namespace scripted
