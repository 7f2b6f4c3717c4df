// OpenGL's sync functions on any thread.
#pragma once

#include "host/GLFunctionTable.h"

#include "standalone/HiddenContext.h"

#include <cstdint>

class QOpenGLContext;
class QOpenGLContextGroup;

namespace vyra::host {

// The driver's functions, and the choice of the context that a call goes to: the calling thread's
// own where that shares with the renderer's, else the hidden one.
class SyncFunctions {
public:
    // `context` is the renderer's and current on the calling GUI thread.
    explicit SyncFunctions(QOpenGLContext& context);

    // Whether the functions below may be called.
    bool usable() const { return fUsable; }

    GLsync fence(unsigned int condition, unsigned int flags);
    void remove(GLsync sync);
    unsigned int clientWait(GLsync sync, unsigned int flags, std::uint64_t timeoutNs);
    void serverWait(GLsync sync, unsigned int flags, std::uint64_t timeoutNs);
    // Null for an invalid event or flags other than 0.
    GLsync fromCLEvent(cl_context context, cl_event event, unsigned int flags);

private:
    bool callerHasContext() const;
    GLsync fenceAndFlush(unsigned int condition, unsigned int flags) const;
    unsigned int waitInTurns(GLsync sync, unsigned int flags, std::uint64_t timeoutNs);

    GLFunctionTable fDriver;
    void (*fFlush)() = nullptr;
    const QOpenGLContextGroup* fShareGroup;
    HiddenContext fHidden;
    bool fUsable;
};

} // namespace vyra::host
