// The renderer's OpenGL sync objects, which use the runtime's log, ledger and planned faults as
// OpenCL's objects do. A sync object that cannot be created is null; a failing wait returns
// GL_WAIT_FAILED.
#include "fake/Entry.h"
#include "fake/FakeHost.h"
#include "host/GLFunctionTable.h"

namespace scripted {
namespace {

constexpr unsigned kWaitFailed = 0x911D; // GL_WAIT_FAILED

GLsync fenceSync(unsigned condition, unsigned flags)
{
    return Entry("glFenceSync", condition, flags).create<GLsync>(Kind::kSync);
}

void deleteSync(GLsync sync)
{
    Entry("glDeleteSync", sync).release(Kind::kSync, sync);
}

unsigned clientWaitSync(GLsync sync, unsigned flags, std::uint64_t timeout)
{
    if (const auto hook = std::exchange(host().duringFenceWait, nullptr))
        hook();
    Entry call("glClientWaitSync", sync, flags, timeout);
    call.object(Kind::kSync, sync);
    return call.ok() ? call.nextClientWait() : kWaitFailed;
}

void waitSync(GLsync sync, unsigned flags, std::uint64_t timeout)
{
    Entry("glWaitSync", sync, flags, timeout).object(Kind::kSync, sync);
}

GLsync createSyncFromCLEvent(cl_context context, cl_event event, unsigned flags)
{
    Entry call("glCreateSyncFromCLeventARB", context, event, flags);
    call.object(Kind::kContext, context);
    call.object(Kind::kEvent, event);
    return call.create<GLsync>(Kind::kSync);
}

} // namespace

void installFunctionTable(bool syncObjects, bool syncFromCLEvent)
{
    static GLFunctionTable table;
    table = {.glFenceSync = fenceSync,
             .glDeleteSync = deleteSync,
             .glClientWaitSync = clientWaitSync,
             .glWaitSync = waitSync,
             .glCreateSyncFromCLeventARB = createSyncFromCLEvent,
             .fSyncObjectsUsable = syncObjects,
             .fSyncFromCLEventUsable = syncFromCLEvent};
    GLFunctionTable::fpGlobalFunctionTable = &table;
}

void removeFunctionTable()
{
    GLFunctionTable::fpGlobalFunctionTable = nullptr;
}

} // namespace scripted
