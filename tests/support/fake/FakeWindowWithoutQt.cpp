// The resource window without Qt: an address that is never dereferenced, because the one function
// that the library calls on it is defined here.
#include "fake/FakeHost.h"

namespace scripted {

std::shared_ptr<void> makeResourceWindow()
{
    static int theWindow;
    host().resourceWindow = reinterpret_cast<QOpenGLWindow*>(&theWindow);
    return {&theWindow, [](void*) { host().resourceWindow = nullptr; }};
}

} // namespace scripted
