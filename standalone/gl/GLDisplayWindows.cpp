#include "host/GLDisplay.h"

#include <windows.h>

#include <CL/cl_gl.h>

GLDisplayProperty glDisplayProperty(void* window)
{
    const HDC deviceContext = GetDC(static_cast<HWND>(window));
    return {CL_WGL_HDC_KHR, reinterpret_cast<cl_context_properties>(deviceContext)};
}
