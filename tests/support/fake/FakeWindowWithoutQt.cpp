// The resource window without Qt: an address that is never dereferenced, because the one function
// that the library calls on it is defined here.
#include "fake/FakeHost.h"

namespace scripted {

ResourceWindow::ResourceWindow() : fWindow(std::make_shared<int>())
{
    host().resourceWindow = reinterpret_cast<QOpenGLWindow*>(fWindow.get());
}

} // namespace scripted
