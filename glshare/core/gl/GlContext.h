// An OpenGL context of glshare's own, which shares objects with a context of the application.
// GlxContext.cpp, EglContext.cpp and windows/WglContext.cpp implement it, one per window system.
#pragma once

#include "core/gl/GlFunctions.h"

#include <functional>
#include <memory>

namespace glshare {

enum class WindowSystem { kGlx, kEgl, kWgl };

// A context of the application, as named by the properties of an OpenCL context.
struct GlContextHandle {
    WindowSystem windowSystem;
    void* display; // for WGL, the device context of a window
    void* context;
};

// One thread at a time; GlWorker uses it on its own thread.
class GlContext {
public:
    GlContext() = default;
    GlContext(const GlContext&) = delete;
    GlContext& operator=(const GlContext&) = delete;

    // Destroys the context, unless it was abandoned. It must not be current on any thread.
    virtual ~GlContext() = default;

    // Makes the context current on the calling thread, without a drawable; returns false on
    // failure.
    [[nodiscard]] virtual bool makeCurrent() = 0;

    // Leaves the calling thread, on which the context is current, without a current context.
    virtual void releaseCurrent() = 0;

    // Called before the display closes. Leaks the context and its objects, since OpenCL commands
    // may still use the storage of its buffers.
    virtual void abandon() = 0;

    // Returns whether any context of this window system is current on the calling thread. Any
    // thread.
    [[nodiscard]] virtual bool callerHasContext() const = 0;

    [[nodiscard]] virtual GlFunctions::Resolver resolver() const noexcept = 0;

    // Registers a callback that runs before the display closes, on the thread that closes it. Does
    // nothing for EGL and WGL, which do not report that.
    virtual void onDisplayClosing(std::function<void()> closing) = 0;
};

// Returns whether the system that glshare is built for has this window system. The functions below
// require it.
[[nodiscard]] bool isSupported(WindowSystem windowSystem) noexcept;

// Returns whether a context can be shared with, as far as that can be queried safely: GLX may end
// the process if it is passed an invalid handle.
[[nodiscard]] bool isShareable(const GlContextHandle& handle);

// Creates a context that shares objects with `handle`; null if the window system refuses. Any
// thread, also while the application's context is current on another one; for WGL, a thread with a
// current context.
[[nodiscard]] std::unique_ptr<GlContext> createSharedGlContext(const GlContextHandle& handle);

// Implement the two functions above on Linux.
[[nodiscard]] bool isShareableGlx(void* display, void* context);
[[nodiscard]] bool isShareableEgl(void* display, void* context);
[[nodiscard]] std::unique_ptr<GlContext> createGlxContext(void* display, void* shareContext);
[[nodiscard]] std::unique_ptr<GlContext> createEglContext(void* display, void* shareContext);

} // namespace glshare
