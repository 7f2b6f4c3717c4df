// The GLX and Xlib functions that glshare calls, resolved at run time: nothing links them.
#pragma once

#include <GL/glx.h>
#include <X11/Xlib.h>

namespace glshare {

// The type of XESetCloseDisplay. Only Xlib's internal header declares it, which C++ cannot include.
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

    // Whether all of the above were found. If not, none may be called.
    bool complete = false;
};

// Loads the libraries with the first call. They stay loaded, since their hooks and exit handlers
// may outlive every context. Any thread.
[[nodiscard]] const GlxFunctions& glx();

} // namespace glshare
