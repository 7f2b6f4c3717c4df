// The window system's entry in the property list of an OpenCL context that shares with OpenGL.
#pragma once

#include "host/HostExport.h"

#include <CL/cl.h>

struct GLDisplayProperty {
    // CL_WGL_HDC_KHR, CL_GLX_DISPLAY_KHR or CL_EGL_DISPLAY_KHR; never 0, which would end the list.
    cl_context_properties name = 0;
    // The device context or display; 0 if no context is current.
    cl_context_properties value = 0;
};

// Returns the property for the renderer's OpenGL context. On Windows: CL_WGL_HDC_KHR with
// GetDC(window), which is never released. Elsewhere: the display of the context that is current on
// the calling thread; `window` is ignored.
VYRA_HOST_API GLDisplayProperty glDisplayProperty(void* window);
