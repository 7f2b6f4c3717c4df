#include "interop/GraphicsSync.h"

#include "host/GLFunctionTable.h"
#include "host/ResourceWindow.h"
#include "runtime/TopenCLInfo.h"

#include <atomic>
#include <cstdint>
#include <mutex>

#include <QOpenGLWindow>

namespace {

// Values of the OpenGL headers.
constexpr unsigned int kGLSyncGPUCommandsComplete = 0x9117;
constexpr unsigned int kGLSyncFlushCommandsBit = 1;
constexpr unsigned int kGLTimeoutExpired = 0x911B;
constexpr std::uint64_t kGLTimeoutIgnored = ~std::uint64_t{0};

// The time-out of one call; each call of a longer wait flushes again.
constexpr std::uint64_t kFenceWaitNanoseconds = 1'000'000'000;

// The renderer's fence, or null if none is pending. The thread that exchanges it out deletes it.
constinit std::atomic<GLsync> sfGraphicsFence = nullptr;

// Held from exchanging the fence until it is deleted, so that other threads return only after the
// wait. Constructed by the first wait: std::mutex has a constructor on some systems, and static
// objects of this file must not have one.
std::mutex& fenceWaitMutex()
{
    static std::mutex theMutex;
    return theMutex;
}

// Returns the host's table if sync objects are usable, else null.
GLFunctionTable* syncObjectFunctions()
{
    GLFunctionTable* gl = GLFunctionTable::fpGlobalFunctionTable;
    return gl && gl->syncObjectsUsable() ? gl : nullptr;
}

} // namespace

void SetGraphicsFence()
{
    GLFunctionTable* gl = syncObjectFunctions();
    if (!gl)
        return;
    if (GLsync unwaited = sfGraphicsFence.exchange(nullptr))
        gl->glDeleteSync(unwaited);
    sfGraphicsFence = gl->glFenceSync(kGLSyncGPUCommandsComplete, 0);
}

void WaitForGraphicsFence()
{
    if (QOpenGLWindow* window = Q3dPort::resourceWindow())
        window->makeCurrent();
    GLFunctionTable* gl = syncObjectFunctions();
    if (!gl)
        return;

    const std::scoped_lock lock(fenceWaitMutex());
    GLsync fence = sfGraphicsFence.exchange(nullptr);
    if (!fence)
        return;
    // Any other result ends the wait, including a failure.
    while (gl->glClientWaitSync(fence, kGLSyncFlushCommandsBit, kFenceWaitNanoseconds) ==
           kGLTimeoutExpired) {
    }
    gl->glDeleteSync(fence);
}

void GraphicsWaitForCLEvent(cl_event event)
{
    GLFunctionTable* gl = syncObjectFunctions();
    if (!gl || !gl->syncFromCLEventUsable())
        return;
    GLsync sync = gl->glCreateSyncFromCLeventARB(TopenCLInfo::theOne().openCLContext(), event, 0);
    if (!sync)
        return;
    gl->glWaitSync(sync, 0, kGLTimeoutIgnored);
    gl->glDeleteSync(sync);
}
