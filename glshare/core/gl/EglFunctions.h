// The EGL functions this program calls.
#pragma once

#include <EGL/egl.h>

namespace glshare {

struct EglFunctions {
    decltype(&::eglGetProcAddress) getProcAddress = nullptr;
    decltype(&::eglBindAPI) bindApi = nullptr;
    decltype(&::eglQueryAPI) queryApi = nullptr;
    decltype(&::eglChooseConfig) chooseConfig = nullptr;
    decltype(&::eglCreateContext) createContext = nullptr;
    decltype(&::eglDestroyContext) destroyContext = nullptr;
    decltype(&::eglGetCurrentContext) getCurrentContext = nullptr;
    decltype(&::eglMakeCurrent) makeCurrent = nullptr;
    decltype(&::eglQueryContext) queryContext = nullptr;
    decltype(&::eglReleaseThread) releaseThread = nullptr;

    // Whether all of the above were found. Nothing may be called otherwise.
    bool complete = false;
};

// Loads the library with the first call, and keeps it: its threads and exit handlers may outlive
// every context.
const EglFunctions& egl();

} // namespace glshare
