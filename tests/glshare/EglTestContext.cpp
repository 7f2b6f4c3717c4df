#include "EglTestContext.h"

#include <CL/cl_gl.h>
#include <EGL/eglext.h>

#include <array>
#include <cstdlib>

EGLDisplay EglTestContext::display()
{
    static EGLDisplay const theDisplay = [] {
        const EGLenum platform = std::getenv("WAYLAND_DISPLAY") == nullptr
                                     ? EGL_PLATFORM_SURFACELESS_MESA
                                     : EGL_PLATFORM_WAYLAND_KHR;
        EGLDisplay display = eglGetPlatformDisplay(platform, EGL_DEFAULT_DISPLAY, nullptr);
        return eglInitialize(display, nullptr, nullptr) == EGL_TRUE ? display : EGL_NO_DISPLAY;
    }();
    return theDisplay;
}

EglTestContext::EglTestContext(const EglTestContext* share, EGLenum api) : fApi(api)
{
    eglBindAPI(api);
    const bool isEs = api == EGL_OPENGL_ES_API;
    // No surface type: some platforms have no configuration for pixel buffers.
    const std::array<EGLint, 5> wanted{EGL_SURFACE_TYPE, 0, EGL_RENDERABLE_TYPE,
                                       isEs ? EGL_OPENGL_ES3_BIT : EGL_OPENGL_BIT, EGL_NONE};
    EGLConfig config = nullptr;
    EGLint count = 0;
    if (eglChooseConfig(display(), wanted.data(), &config, 1, &count) != EGL_TRUE || count == 0)
        return;
    const std::array<EGLint, 5> attributes{EGL_CONTEXT_MAJOR_VERSION, isEs ? 3 : 4,
                                           EGL_CONTEXT_MINOR_VERSION, isEs ? 0 : 5, EGL_NONE};
    fContext = eglCreateContext(
        display(), config, share == nullptr ? EGL_NO_CONTEXT : share->fContext, attributes.data());
}

EglTestContext::~EglTestContext()
{
    destroy();
}

std::vector<cl_context_properties> EglTestContext::entries() const
{
    return {CL_GL_CONTEXT_KHR, reinterpret_cast<cl_context_properties>(fContext),
            CL_EGL_DISPLAY_KHR, reinterpret_cast<cl_context_properties>(display())};
}

void EglTestContext::makeCurrent() const
{
    eglBindAPI(fApi);
    eglMakeCurrent(display(), EGL_NO_SURFACE, EGL_NO_SURFACE, fContext);
}

void EglTestContext::releaseCurrent()
{
    eglMakeCurrent(display(), EGL_NO_SURFACE, EGL_NO_SURFACE, EGL_NO_CONTEXT);
}

void EglTestContext::destroy()
{
    if (fContext == EGL_NO_CONTEXT)
        return;
    if (eglGetCurrentContext() == fContext)
        releaseCurrent();
    eglDestroyContext(display(), fContext);
    fContext = EGL_NO_CONTEXT;
}
