// The display of the OpenGL context that is current on the calling thread. If a context is current,
// its window-system library is loaded: GLX and EGL are looked up, not linked.
#include "host/GLDisplay.h"

#include "standalone/system/Platform.h"

#include <CL/cl_gl.h>

#include <initializer_list>

namespace {

// Calls a function of the library that has no arguments and returns a handle. Returns null if the
// library is not loaded or has no such function.
void* askCurrentDisplay(std::initializer_list<const char*> libraries, const char* function)
{
    for (const char* library : libraries) {
        if (void* const address = vyra::host::symbolOfLoadedLibrary(library, function)) {
            return reinterpret_cast<void* (*)()>(address)();
        }
    }
    return nullptr;
}

} // namespace

GLDisplayProperty glDisplayProperty(void* /*window*/)
{
    if (void* const glx =
            askCurrentDisplay({"libGLX.so.0", "libGL.so.1"}, "glXGetCurrentDisplay")) {
        return {CL_GLX_DISPLAY_KHR, reinterpret_cast<cl_context_properties>(glx)};
    }
    if (void* const egl = askCurrentDisplay({"libEGL.so.1"}, "eglGetCurrentDisplay")) {
        return {CL_EGL_DISPLAY_KHR, reinterpret_cast<cl_context_properties>(egl)};
    }
    return {CL_GLX_DISPLAY_KHR, 0};
}
