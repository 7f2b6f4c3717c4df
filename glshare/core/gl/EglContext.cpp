// Implements GlContext for EGL. EGL is loaded at run time: nothing links it.
#include "core/gl/GlContext.h"
#include "core/gl/LibraryFunctions.h"

#include <EGL/egl.h>
#include <EGL/eglext.h>

#include <array>

namespace glshare {

namespace {

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

    // Whether all of the above were found. If not, none may be called.
    bool complete = false;
};

EglFunctions loadEgl()
{
    EglFunctions egl;
    const LibraryFunctions library("libEGL.so.1");
    egl.complete = library.find(egl.getProcAddress, "eglGetProcAddress") &&
                   library.find(egl.bindApi, "eglBindAPI") &&
                   library.find(egl.queryApi, "eglQueryAPI") &&
                   library.find(egl.chooseConfig, "eglChooseConfig") &&
                   library.find(egl.createContext, "eglCreateContext") &&
                   library.find(egl.destroyContext, "eglDestroyContext") &&
                   library.find(egl.getCurrentContext, "eglGetCurrentContext") &&
                   library.find(egl.makeCurrent, "eglMakeCurrent") &&
                   library.find(egl.queryContext, "eglQueryContext") &&
                   library.find(egl.releaseThread, "eglReleaseThread");
    return egl;
}

// Loads EGL with the first call. It stays loaded, since its threads and exit handlers may outlive
// every context.
const EglFunctions& egl()
{
    static const EglFunctions theFunctions = loadEgl();
    return theFunctions;
}

void* resolveGl(const char* name)
{
    return reinterpret_cast<void*>(egl().getProcAddress(name));
}

// The functions are called only for contexts that the application has made with EGL.
// NOLINTBEGIN(clang-analyzer-core.CallAndMessage)
class EglContext final : public GlContext {
public:
    // Owns no context until own() is called.
    EglContext(EGLDisplay display, EGLenum api) : fDisplay(display), fApi(api) {}

    // eglDestroyContext fails after the application's eglTerminate, which has no effect here.
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

    // eglMakeCurrent fails to unbind on a terminated display; eglReleaseThread does not.
    void releaseCurrent() override { egl().releaseThread(); }

    // EGL keeps a current context alive after its display is terminated.
    void abandon() override {}

    bool callerHasContext() const override { return egl().getCurrentContext() != EGL_NO_CONTEXT; }

    GlFunctions::Resolver resolver() const noexcept override { return resolveGl; }

    void onDisplayClosing(std::function<void()>) override {}

private:
    EGLDisplay fDisplay;
    EGLContext fContext = EGL_NO_CONTEXT;
    EGLenum fApi;
};

// Returns the configuration of a context; EGL_NO_CONFIG_KHR if it was created without one.
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

    // Contexts share only within one client API. 3.3 and ES 3.0 are the oldest versions with all
    // the functions that GlFunctions needs.
    const std::array<EGLint, 5> attributes{EGL_CONTEXT_MAJOR_VERSION, 3, EGL_CONTEXT_MINOR_VERSION,
                                           api == EGL_OPENGL_API ? 3 : 0, EGL_NONE};
    // The bound API is state of the calling thread, and is restored.
    const EGLenum previousApi = egl().queryApi();
    egl().bindApi(api);
    EGLContext context = egl().createContext(display, configOf(display, shareContext), shareContext,
                                             attributes.data());
    egl().bindApi(previousApi);
    if (context == EGL_NO_CONTEXT)
        return nullptr;
    result->own(context);
    return result;
}

// NOLINTEND(clang-analyzer-core.CallAndMessage)

} // namespace glshare
