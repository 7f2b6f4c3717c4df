// An OpenGL context of our own in the share group of one of the application's, behind an interface
// that hides the window system. One source file per window system implements it.
#pragma once

#include "core/gl/GlFunctions.h"

#include <functional>
#include <memory>

namespace glshare {

enum class WindowSystem { kGlx, kEgl, kWgl };

// The application's context, as it came in the properties of an OpenCL context.
struct GlBinding {
    WindowSystem windowSystem;
    void* display; // with WGL, the device context of a window
    void* context;
};

class GlContext {
public:
    GlContext() = default;
    GlContext(const GlContext&) = delete;
    GlContext& operator=(const GlContext&) = delete;

    // Destroys the context, unless it was abandoned. It must not be current on any thread.
    virtual ~GlContext() = default;

    // Makes the context current on the calling thread, without a drawable; false on failure.
    [[nodiscard]] virtual bool makeCurrent() = 0;

    // Leaves the calling thread without a current context.
    virtual void releaseCurrent() = 0;

    // The display is about to go. What the context holds is left behind on purpose, since OpenCL
    // commands may still be using the storage of its buffers.
    virtual void abandon() = 0;

    // Whether any context of this window system is current on the calling thread.
    [[nodiscard]] virtual bool callerHasContext() const = 0;

    [[nodiscard]] virtual GlFunctions::Resolver resolver() const = 0;

    // `closing` is called, on the thread that closes the display, before the display goes. Never
    // called where the window system gives no such notice.
    virtual void onDisplayClosing(std::function<void()> closing) = 0;
};

// Whether contexts of this window system are known on the system that this is built for. What
// follows is for bindings of those.
[[nodiscard]] bool isSupported(WindowSystem windowSystem);

// Whether `binding` names a context that can be shared with, as far as the window system can tell
// without a risk.
[[nodiscard]] bool isShareable(const GlBinding& binding);

// Creates a context that shares with `binding`; null if the window system refuses. Any thread, also
// while the application's context is current on another.
[[nodiscard]] std::unique_ptr<GlContext> createSharingContext(const GlBinding& binding);

// The parts of the two functions above for each window system of Linux.
[[nodiscard]] bool isShareableGlx(void* display, void* context);
[[nodiscard]] bool isShareableEgl(void* display, void* context);
[[nodiscard]] std::unique_ptr<GlContext> createGlxContext(void* display, void* shareContext);
[[nodiscard]] std::unique_ptr<GlContext> createEglContext(void* display, void* shareContext);

} // namespace glshare
