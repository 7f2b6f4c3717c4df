// Implements GlContext for EGL.
#include "core/gl/EglFunctions.h"
#include "core/gl/GlContext.h"

#include <EGL/eglext.h>

#include <array>

namespace glshare {

namespace {

void* resolveGl(const char* name)
{
    return reinterpret_cast<void*>(egl().getProcAddress(name));
}

class EglContext final : public GlContext {
public:
    // Owns no context yet.
    EglContext(EGLDisplay display, EGLenum api) : fDisplay(display), fApi(api) {}

    // After the application's eglTerminate this is refused with an error, which is fine.
    ~EglContext() override
    {
        if (fContext != EGL_NO_CONTEXT)
            egl().destroyContext(fDisplay, fContext);
    }

    void own(EGLContext context) { fContext = context; }

    bool makeCurrent() override
    {
        return egl().bindApi(fApi) == EGL_TRUE &&
               egl().makeCurrent(fDisplay, EGL_NO_SURFACE, EGL_NO_SURFACE, fContext) == EGL_TRUE;
    }

    // eglMakeCurrent would refuse to unbind on a terminated display; this never does.
    void releaseCurrent() override { egl().releaseThread(); }

    // EGL keeps what is current alive beyond its display.
    void abandon() override {}

    bool callerHasContext() const override { return egl().getCurrentContext() != EGL_NO_CONTEXT; }

    GlFunctions::Resolver resolver() const override { return resolveGl; }

    void onDisplayClosing(std::function<void()>) override {}

private:
    EGLDisplay fDisplay;
    EGLContext fContext = EGL_NO_CONTEXT;
    EGLenum fApi;
};

// The configuration of the application's context, or none at all where it was made without one.
EGLConfig configOf(EGLDisplay display, EGLContext context)
{
    EGLint id = 0;
    if (egl().queryContext(display, context, EGL_CONFIG_ID, &id) != EGL_TRUE || id == 0)
        return EGL_NO_CONFIG_KHR;
    const std::array<EGLint, 3> wanted{EGL_CONFIG_ID, id, EGL_NONE};
    EGLConfig config = EGL_NO_CONFIG_KHR;
    EGLint count = 0;
    egl().chooseConfig(display, wanted.data(), &config, 1, &count);
    return count == 1 ? config : EGL_NO_CONFIG_KHR;
}

} // namespace

bool isShareableEgl(void* display, void* context)
{
    EGLint type = 0;
    return egl().complete &&
           egl().queryContext(display, context, EGL_CONTEXT_CLIENT_TYPE, &type) == EGL_TRUE &&
           (type == EGL_OPENGL_API || type == EGL_OPENGL_ES_API);
}

std::unique_ptr<GlContext> createEglContext(void* display, void* shareContext)
{
    if (!isShareableEgl(display, shareContext))
        return nullptr;
    EGLint type = 0;
    egl().queryContext(display, shareContext, EGL_CONTEXT_CLIENT_TYPE, &type);
    const auto api = static_cast<EGLenum>(type);
    auto result = std::make_unique<EglContext>(display, api);

    // Only contexts of one client interface share. 3.3 and ES 3.0 are the oldest that have all we
    // call.
    const std::array<EGLint, 5> attributes{EGL_CONTEXT_MAJOR_VERSION, 3, EGL_CONTEXT_MINOR_VERSION,
                                           api == EGL_OPENGL_API ? 3 : 0, EGL_NONE};
    // The bound interface belongs to the thread, so it is put back for the application.
    const EGLenum before = egl().queryApi();
    egl().bindApi(api);
    EGLContext context = egl().createContext(display, configOf(display, shareContext), shareContext,
                                             attributes.data());
    egl().bindApi(before);
    if (context == EGL_NO_CONTEXT)
        return nullptr;
    result->own(context);
    return result;
}

} // namespace glshare
