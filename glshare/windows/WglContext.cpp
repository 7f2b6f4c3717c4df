// Implements GlContext for WGL.
//
// The context is created for the application's device context. It is made current with a hidden
// window of the same pixel format, which belongs to the worker's thread.
#include "core/gl/GlContext.h"
#include "core/gl/LibraryFunctions.h"

#include <array>

#include <windows.h>

#include <GL/gl.h>
#include <GL/wglext.h>

namespace glshare {

namespace {

struct WglFunctions {
    decltype(&::wglCreateContext) createContext = nullptr;
    decltype(&::wglDeleteContext) deleteContext = nullptr;
    decltype(&::wglGetCurrentContext) getCurrentContext = nullptr;
    decltype(&::wglGetProcAddress) getProcAddress = nullptr;
    decltype(&::wglMakeCurrent) makeCurrent = nullptr;
    decltype(&::DescribePixelFormat) describePixelFormat = nullptr;
    decltype(&::GetPixelFormat) getPixelFormat = nullptr;
    decltype(&::SetPixelFormat) setPixelFormat = nullptr;
    // Whether all of the above were found. If not, none may be called.
    bool complete = false;
};

WglFunctions loadWgl()
{
    WglFunctions wgl;
    const LibraryFunctions gl("opengl32.dll");
    const LibraryFunctions gdi("gdi32.dll");
    wgl.complete = gl.find(wgl.createContext, "wglCreateContext") &&
                   gl.find(wgl.deleteContext, "wglDeleteContext") &&
                   gl.find(wgl.getCurrentContext, "wglGetCurrentContext") &&
                   gl.find(wgl.getProcAddress, "wglGetProcAddress") &&
                   gl.find(wgl.makeCurrent, "wglMakeCurrent") &&
                   gdi.find(wgl.describePixelFormat, "DescribePixelFormat") &&
                   gdi.find(wgl.getPixelFormat, "GetPixelFormat") &&
                   gdi.find(wgl.setPixelFormat, "SetPixelFormat");
    return wgl;
}

const WglFunctions& wgl()
{
    static const WglFunctions theFunctions = loadWgl();
    return theFunctions;
}

// wglGetProcAddress finds extensions and functions newer than OpenGL 1.1; the library exports the
// others.
void* resolveGl(const char* name)
{
    if (const PROC extension = wgl().getProcAddress(name))
        return reinterpret_cast<void*>(extension);
    static const LibraryFunctions gl("opengl32.dll");
    void* function = nullptr;
    return gl.find(function, name) ? function : nullptr;
}

class WglContext final : public GlContext {
public:
    WglContext(HGLRC context, int pixelFormat) : fContext(context), fPixelFormat(pixelFormat) {}

    ~WglContext() override { wgl().deleteContext(fContext); }

    bool makeCurrent() override
    {
        fWindow = CreateWindowExW(0, L"STATIC", L"glshare", WS_POPUP, 0, 0, 1, 1, nullptr, nullptr,
                                  nullptr, nullptr);
        fDevice = GetDC(fWindow);
        PIXELFORMATDESCRIPTOR description{};
        wgl().describePixelFormat(fDevice, fPixelFormat, sizeof description, &description);
        return wgl().setPixelFormat(fDevice, fPixelFormat, &description) &&
               wgl().makeCurrent(fDevice, fContext);
    }

    // On the thread that called makeCurrent, which owns the window.
    void releaseCurrent() override
    {
        wgl().makeCurrent(nullptr, nullptr);
        ReleaseDC(fWindow, fDevice);
        DestroyWindow(fWindow);
    }

    void abandon() override {}

    bool callerHasContext() const override { return wgl().getCurrentContext() != nullptr; }

    GlFunctions::Resolver resolver() const noexcept override { return resolveGl; }

    void onDisplayClosing(std::function<void()>) override {}

private:
    HGLRC fContext;
    int fPixelFormat;
    HWND fWindow = nullptr;
    HDC fDevice = nullptr;
};

} // namespace

bool isSupported(WindowSystem windowSystem) noexcept
{
    return windowSystem == WindowSystem::kWgl;
}

bool isShareable(const GlContextHandle& handle)
{
    return handle.context != nullptr && wgl().complete &&
           wgl().getPixelFormat(static_cast<HDC>(handle.display)) != 0;
}

// A context must be current on the calling thread: WGL finds its extension functions only then.
std::unique_ptr<GlContext> createSharedGlContext(const GlContextHandle& handle)
{
    const auto device = static_cast<HDC>(handle.display);
    const auto create = reinterpret_cast<PFNWGLCREATECONTEXTATTRIBSARBPROC>(
        resolveGl("wglCreateContextAttribsARB"));
    if (create == nullptr)
        return nullptr;
    // 3.3 is the oldest version with all the functions that GlFunctions needs.
    const std::array<int, 7> attributes{WGL_CONTEXT_MAJOR_VERSION_ARB,
                                        3,
                                        WGL_CONTEXT_MINOR_VERSION_ARB,
                                        3,
                                        WGL_CONTEXT_PROFILE_MASK_ARB,
                                        WGL_CONTEXT_CORE_PROFILE_BIT_ARB,
                                        0};
    const HGLRC context = create(device, static_cast<HGLRC>(handle.context), attributes.data());
    if (context == nullptr)
        return nullptr;
    return std::make_unique<WglContext>(context, wgl().getPixelFormat(device));
}

} // namespace glshare
