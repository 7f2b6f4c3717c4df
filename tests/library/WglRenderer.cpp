#include "Renderer.h"

#include "host/GLFunctionTable.h"

#include <CL/cl.h>
#include <mutex>

#include <windows.h>

#include <GL/gl.h>
#include <GL/glext.h>
#include <GL/wglext.h>

namespace {

void* glFunction(const char* name)
{
    if (const PROC extension = wglGetProcAddress(name))
        return reinterpret_cast<void*>(extension);
    return reinterpret_cast<void*>(GetProcAddress(GetModuleHandleA("opengl32.dll"), name));
}

// A window that is never shown, with a pixel format for OpenGL.
struct Window {
    HWND window = CreateWindowExA(0, "STATIC", "vyra-opencl-tests", WS_POPUP, 0, 0, 16, 16, nullptr,
                                  nullptr, nullptr, nullptr);
    HDC device = GetDC(window);

    Window()
    {
        PIXELFORMATDESCRIPTOR wanted{};
        wanted.nSize = sizeof wanted;
        wanted.nVersion = 1;
        wanted.dwFlags = PFD_DRAW_TO_WINDOW | PFD_SUPPORT_OPENGL;
        wanted.iPixelType = PFD_TYPE_RGBA;
        wanted.cColorBits = 24;
        SetPixelFormat(device, ChoosePixelFormat(device, &wanted), &wanted);
    }
    ~Window() { DestroyWindow(window); }
    Window(const Window&) = delete;
    Window& operator=(const Window&) = delete;
};

// Threads without a context call the sync functions in a second context, one at a time.
class HiddenContext {
public:
    void create(HGLRC shared)
    {
        fContext = wglCreateContext(fWindow.device);
        wglShareLists(shared, fContext);
    }
    ~HiddenContext() { wglDeleteContext(fContext); }

    template <typename Function>
    auto call(Function function)
    {
        if (wglGetCurrentContext())
            return function();
        const std::scoped_lock lock(fMutex);
        wglMakeCurrent(fWindow.device, fContext);
        auto result = function();
        wglMakeCurrent(nullptr, nullptr);
        return result;
    }

private:
    Window fWindow;
    HGLRC fContext = nullptr;
    std::mutex fMutex; // held while the context is current on the calling thread
};

// The driver's functions, found while the renderer's context is current.
PFNGLFENCESYNCPROC fenceSync;
PFNGLDELETESYNCPROC deleteSync;
PFNGLCLIENTWAITSYNCPROC clientWaitSync;
PFNGLWAITSYNCPROC waitSync;
HiddenContext* hidden;

GLFunctionTable makeTable()
{
    fenceSync = reinterpret_cast<PFNGLFENCESYNCPROC>(glFunction("glFenceSync"));
    deleteSync = reinterpret_cast<PFNGLDELETESYNCPROC>(glFunction("glDeleteSync"));
    clientWaitSync = reinterpret_cast<PFNGLCLIENTWAITSYNCPROC>(glFunction("glClientWaitSync"));
    waitSync = reinterpret_cast<PFNGLWAITSYNCPROC>(glFunction("glWaitSync"));
    GLFunctionTable table;
    table.glFenceSync = [](unsigned condition, unsigned flags) {
        return hidden->call([=] { return fenceSync(condition, flags); });
    };
    table.glDeleteSync = [](GLsync sync) { hidden->call([=] { return deleteSync(sync), true; }); };
    table.glClientWaitSync = [](GLsync sync, unsigned flags, std::uint64_t timeout) -> unsigned {
        return hidden->call([=] { return clientWaitSync(sync, flags, timeout); });
    };
    table.glWaitSync = [](GLsync sync, unsigned flags, std::uint64_t timeout) {
        hidden->call([=] { return waitSync(sync, flags, timeout), true; });
    };
    // No driver under test creates a sync object from an event.
    table.glCreateSyncFromCLeventARB = [](cl_context, cl_event event, unsigned flags) {
        clWaitForEvents(1, &event);
        return hidden->call([=] { return fenceSync(GL_SYNC_GPU_COMMANDS_COMPLETE, flags); });
    };
    table.fSyncObjectsUsable = fenceSync && deleteSync && clientWaitSync && waitSync;
    table.fSyncFromCLEventUsable = table.fSyncObjectsUsable;
    return table;
}

class WglRenderer : public Renderer {
public:
    ~WglRenderer() override
    {
        GLFunctionTable::fpGlobalFunctionTable = nullptr;
        wglMakeCurrent(nullptr, nullptr);
        wglDeleteContext(fContext);
    }

    bool begin()
    {
        fContext = wglCreateContext(fWindow.device);
        if (!fContext)
            return false;
        fHidden.create(fContext);
        if (!wglMakeCurrent(fWindow.device, fContext))
            return false;
        hidden = &fHidden;
        fTable = makeTable();
        GLFunctionTable::fpGlobalFunctionTable = &fTable;
        return true;
    }

    void* window() const override { return fWindow.window; }
    void* context() const override { return fContext; }

private:
    void* function(const char* name) const override { return glFunction(name); }

    Window fWindow;
    HGLRC fContext = nullptr;
    HiddenContext fHidden;
    GLFunctionTable fTable;
};

} // namespace

std::unique_ptr<Renderer> Renderer::make()
{
    auto renderer = std::make_unique<WglRenderer>();
    return renderer->begin() ? std::move(renderer) : nullptr;
}
