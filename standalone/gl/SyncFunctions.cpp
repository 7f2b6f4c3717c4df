#include "standalone/gl/SyncFunctions.h"

#include "loader/OpenCLLibraryName.h"
#include "standalone/system/Platform.h"

#include <QOpenGLContext>
#include <QSurfaceFormat>

#include <algorithm>
#include <utility>

namespace vyra::host {
namespace {

// Values of the OpenGL registry, which the OpenGL ES headers that Qt may choose lack.
constexpr unsigned int kGlSyncGpuCommandsComplete = 0x9117;
constexpr unsigned int kGlTimeoutExpired = 0x911B;
constexpr std::uint64_t kGlTimeoutIgnored = ~std::uint64_t{0};

// The longest time, in nanoseconds, for which one wait occupies the hidden context: long compared
// with passing a call to its thread (microseconds).
constexpr std::uint64_t kTurnNs = 1'000'000;

template <class Function>
void resolve(QOpenGLContext& context, const char* name, Function*& function)
{
    function = reinterpret_cast<Function*>(context.getProcAddress(name));
}

bool hasSyncObjects(const QOpenGLContext& context)
{
    const std::pair<int, int> since = context.isOpenGLES() ? std::pair(3, 0) : std::pair(3, 2);
    return context.format().version() >= since || context.hasExtension("GL_ARB_sync");
}

GLFunctionTable driverFunctions(QOpenGLContext& context)
{
    GLFunctionTable table;
    if (hasSyncObjects(context)) {
        resolve(context, "glFenceSync", table.glFenceSync);
        resolve(context, "glDeleteSync", table.glDeleteSync);
        resolve(context, "glClientWaitSync", table.glClientWaitSync);
        resolve(context, "glWaitSync", table.glWaitSync);
        table.fSyncObjectsUsable = table.glFenceSync != nullptr && table.glDeleteSync != nullptr &&
                                   table.glClientWaitSync != nullptr && table.glWaitSync != nullptr;
    }
    if (context.hasExtension("GL_ARB_cl_event")) {
        resolve(context, "glCreateSyncFromCLeventARB", table.glCreateSyncFromCLeventARB);
        table.fSyncFromCLEventUsable = table.glCreateSyncFromCLeventARB != nullptr;
    }
    return table;
}

// Waits until the event's command has ended, successfully or not. Returns false for an invalid
// event.
bool waitForCLEvent(cl_event event)
{
    using WaitForEvents = cl_int(CL_API_CALL*)(cl_uint, const cl_event*);
    // The event comes from the OpenCL library that the application has loaded, if any.
    static const auto waitForEvents = reinterpret_cast<WaitForEvents>(
        symbolOfLoadedLibrary(kOpenCLLibraryName, "clWaitForEvents"));
    if (waitForEvents == nullptr || event == nullptr) {
        return false;
    }
    const cl_int status = waitForEvents(1, &event);
    return status == CL_SUCCESS || status == CL_EXEC_STATUS_ERROR_FOR_EVENTS_IN_WAIT_LIST;
}

} // namespace

SyncFunctions::SyncFunctions(QOpenGLContext& context)
    : fDriver(driverFunctions(context)), fShareGroup(context.shareGroup()), fHidden(context)
{
    resolve(context, "glFlush", fFlush);
    fUsable = fDriver.syncObjectsUsable() && fFlush != nullptr && fHidden.valid();
}

GLsync SyncFunctions::fence(unsigned int condition, unsigned int flags)
{
    if (callerHasContext()) {
        return fDriver.glFenceSync(condition, flags);
    }
    return fHidden.call([&] { return fenceAndFlush(condition, flags); });
}

void SyncFunctions::remove(GLsync sync)
{
    if (callerHasContext()) {
        fDriver.glDeleteSync(sync);
    } else {
        fHidden.run([&] { fDriver.glDeleteSync(sync); });
    }
}

unsigned int SyncFunctions::clientWait(GLsync sync, unsigned int flags, std::uint64_t timeoutNs)
{
    return callerHasContext() ? fDriver.glClientWaitSync(sync, flags, timeoutNs)
                              : waitInTurns(sync, flags, timeoutNs);
}

void SyncFunctions::serverWait(GLsync sync, unsigned int flags, std::uint64_t timeoutNs)
{
    if (callerHasContext()) {
        fDriver.glWaitSync(sync, flags, timeoutNs);
    } else {
        // A wait of the hidden context's command stream would delay no drawing.
        waitInTurns(sync, flags, timeoutNs);
    }
}

GLsync SyncFunctions::fromCLEvent(cl_context context, cl_event event, unsigned int flags)
{
    const auto inContext = [this](const auto& create) {
        return callerHasContext() ? create() : fHidden.call(create);
    };
    if (fDriver.syncFromCLEventUsable()) {
        // Fails if the event's context is not the driver's own sharing one, for example if a layer
        // shares.
        const GLsync sync =
            inContext([&] { return fDriver.glCreateSyncFromCLeventARB(context, event, flags); });
        if (sync != nullptr) {
            return sync;
        }
    }
    if (flags != 0 || !waitForCLEvent(event)) {
        return nullptr;
    }
    return inContext([this] { return fenceAndFlush(kGlSyncGpuCommandsComplete, 0); });
}

bool SyncFunctions::callerHasContext() const
{
    const QOpenGLContext* const current = QOpenGLContext::currentContext();
    return current != nullptr && current->shareGroup() == fShareGroup;
}

// Creates a fence and flushes, so that it is signalled without further calls in its context.
GLsync SyncFunctions::fenceAndFlush(unsigned int condition, unsigned int flags) const
{
    const GLsync sync = fDriver.glFenceSync(condition, flags);
    fFlush();
    return sync;
}

// Calls glClientWaitSync in the hidden context, alternating with the waits of other threads.
unsigned int SyncFunctions::waitInTurns(GLsync sync, unsigned int flags, std::uint64_t timeoutNs)
{
    std::uint64_t remaining = timeoutNs;
    while (true) {
        const std::uint64_t turn = std::min(remaining, kTurnNs);
        const unsigned int result =
            fHidden.call([&] { return fDriver.glClientWaitSync(sync, flags, turn); });
        if (result != kGlTimeoutExpired || turn == remaining) {
            return result;
        }
        remaining -= timeoutNs == kGlTimeoutIgnored ? 0 : turn;
    }
}

} // namespace vyra::host
