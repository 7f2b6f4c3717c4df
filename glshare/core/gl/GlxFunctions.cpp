#include "core/gl/GlxFunctions.h"

#include "core/gl/LibraryFunctions.h"

namespace glshare {

namespace {

GlxFunctions loadGlx()
{
    GlxFunctions glx;
    const LibraryFunctions gl("libGL.so.1");
    const LibraryFunctions x11("libX11.so.6");
    glx.complete = gl.find(glx.getProcAddress, "glXGetProcAddressARB") &&
                   gl.find(glx.getFBConfigs, "glXGetFBConfigs") &&
                   gl.find(glx.getFBConfigAttrib, "glXGetFBConfigAttrib") &&
                   gl.find(glx.destroyContext, "glXDestroyContext") &&
                   gl.find(glx.getCurrentContext, "glXGetCurrentContext") &&
                   gl.find(glx.makeContextCurrent, "glXMakeContextCurrent") &&
                   gl.find(glx.queryContext, "glXQueryContext") &&
                   x11.find(glx.addExtension, "XAddExtension") &&
                   x11.find(glx.setCloseDisplay, "XESetCloseDisplay") &&
                   x11.find(glx.setErrorHandler, "XSetErrorHandler") &&
                   x11.find(glx.sync, "XSync") && x11.find(glx.free, "XFree");
    if (!glx.complete)
        return glx;
    glx.createContextAttribs = reinterpret_cast<PFNGLXCREATECONTEXTATTRIBSARBPROC>(
        glx.getProcAddress(reinterpret_cast<const GLubyte*>("glXCreateContextAttribsARB")));
    glx.complete = glx.createContextAttribs != nullptr;
    return glx;
}

} // namespace

const GlxFunctions& glx()
{
    static const GlxFunctions theFunctions = loadGlx();
    return theFunctions;
}

} // namespace glshare
