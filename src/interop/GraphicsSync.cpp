#include "interop/GraphicsSync.h"

#include "host/GLFunctionTable.h"
#include "host/ResourceWindow.h"
#include "runtime/TopenCLInfo.h"

#include <atomic>
#include <cstdint>
#include <mutex>

#include <QOpenGLWindow>

namespace {

// As in the OpenGL headers.
constexpr unsigned int kGLSyncGPUCommandsComplete = 0x9117;
constexpr unsigned int kGLSyncFlushCommandsBit = 1;
constexpr unsigned int kGLTimeoutExpired = 0x911B;
constexpr std::uint64_t kGLTimeoutIgnored = ~std::uint64_t{0};

// One slice of a wait: long enough to cost nothing, short enough that the flush bit is given again.
constexpr std::uint64_t kFenceWaitNanoseconds = 1'000'000'000;

// The renderer's fence, or null while none is pending. Whoever exchanges it out deletes it.
constinit std::atomic<GLsync> sfGraphicsFence = nullptr;

// Held from taking the fence out until it is deleted, so that nobody overtakes a wait. Made with
// the first wait: std::mutex needs a constructor on some systems, and no static object here may
// have one.
std::mutex& fenceWaitMutex()
{
    static std::mutex theMutex;
    return theMutex;
}

// The host's table when sync objects are usable, else null.
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
    // Any other answer ends the wait, a failure too.
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
