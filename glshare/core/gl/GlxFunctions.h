// The GLX and Xlib functions this program calls.
#pragma once

#include <GL/glx.h>
#include <X11/Xlib.h>

namespace glshare {

// Of XESetCloseDisplay, which only Xlib's internal header declares. That header suits no C++
// program.
using CloseDisplayHook = int (*)(Display*, XExtCodes*);
using SetCloseDisplay = CloseDisplayHook (*)(Display*, int extension, CloseDisplayHook);

struct GlxFunctions {
    decltype(&::glXGetProcAddressARB) getProcAddress = nullptr;
    decltype(&::glXGetFBConfigs) getFBConfigs = nullptr;
    decltype(&::glXGetFBConfigAttrib) getFBConfigAttrib = nullptr;
    decltype(&::glXDestroyContext) destroyContext = nullptr;
    decltype(&::glXGetCurrentContext) getCurrentContext = nullptr;
    decltype(&::glXMakeContextCurrent) makeContextCurrent = nullptr;
    decltype(&::glXQueryContext) queryContext = nullptr;
    PFNGLXCREATECONTEXTATTRIBSARBPROC createContextAttribs = nullptr;
    decltype(&::XAddExtension) addExtension = nullptr;
    SetCloseDisplay setCloseDisplay = nullptr;
    decltype(&::XSetErrorHandler) setErrorHandler = nullptr;
    decltype(&::XSync) sync = nullptr;
    decltype(&::XFree) free = nullptr;

    // Whether all of the above were found. Nothing may be called otherwise.
    bool complete = false;
};

// Loads the libraries with the first call, and keeps them: their hooks and exit handlers may
// outlive every context.
const GlxFunctions& glx();

} // namespace glshare
