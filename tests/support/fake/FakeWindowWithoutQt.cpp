// The resource window where there is no Qt: an address behind which nobody looks, since the one
// operation that the library calls is ours.
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
