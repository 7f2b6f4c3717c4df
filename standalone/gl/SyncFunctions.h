// OpenGL's sync functions on any thread.
#pragma once

#include "host/GLFunctionTable.h"

#include "standalone/gl/HiddenContext.h"

#include <cstdint>

class QOpenGLContext;
class QOpenGLContextGroup;

namespace vyra::host {

// The driver's sync functions, called in the calling thread's context if that shares with the
// renderer's, else in the hidden context.
class SyncFunctions {
public:
    // Requires that `context`, the renderer's, is current on the calling GUI thread.
    explicit SyncFunctions(QOpenGLContext& context);

    // Whether the functions below may be called.
    bool usable() const noexcept { return fUsable; }

    [[nodiscard]] GLsync fence(unsigned int condition, unsigned int flags);
    void remove(GLsync sync);
    [[nodiscard]] unsigned int clientWait(GLsync sync, unsigned int flags, std::uint64_t timeoutNs);
    void serverWait(GLsync sync, unsigned int flags, std::uint64_t timeoutNs);
    // Returns null for an invalid event or flags other than 0.
    [[nodiscard]] GLsync fromCLEvent(cl_context context, cl_event event, unsigned int flags);

private:
    bool callerHasContext() const;
    [[nodiscard]] GLsync fenceAndFlush(unsigned int condition, unsigned int flags) const;
    unsigned int waitInTurns(GLsync sync, unsigned int flags, std::uint64_t timeoutNs);

    GLFunctionTable fDriver;
    void (*fFlush)() = nullptr;
    const QOpenGLContextGroup* fShareGroup;
    HiddenContext fHidden;
    bool fUsable;
};

} // namespace vyra::host
