#include "core/sharing/GlSyncEvents.h"

#include "core/api/Arguments.h"
#include "core/sharing/EventList.h"
#include "core/sharing/EventRegistry.h"

#include <utility>

namespace glshare {

namespace {

// Completes an event when a sync object is signalled. Keeps the context alive, whose worker polls
// it.
class SyncTask final : public GlTask {
public:
    SyncTask(std::shared_ptr<SharingContext> context, GLsync sync) noexcept
        : fContext(std::move(context)), fSync(sync)
    {
    }

    bool run(GlBufferAccess* gl) noexcept override
    {
        const bool exists = gl != nullptr && gl->isSync(fSync);
        if (exists && !gl->isSignalled(fSync))
            return false;
        runtime().clSetUserEventStatus(events.back(), exists ? CL_COMPLETE : CL_INVALID_GL_OBJECT);
        return true;
    }

    EventList events; // one event

private:
    std::shared_ptr<SharingContext> fContext;
    GLsync fSync;
};

} // namespace

cl_event createSyncEvent(cl_context handle, const std::shared_ptr<SharingContext>& context,
                         GLsync sync, cl_int* error)
{
    bool isSync = false;
    context->worker().call([&](const GlBufferAccess* gl) {
        isSync = gl != nullptr && sync != nullptr && gl->isSync(sync);
    });
    if (!isSync) {
        setError(error, CL_INVALID_GL_OBJECT);
        return nullptr;
    }
    EventRegistry::PreparedEntry type =
        EventRegistry::get().prepareEntry(CL_COMMAND_GL_FENCE_SYNC_OBJECT_KHR);
    auto task = std::make_unique<SyncTask>(context, sync);
    const cl_int result = task->events.add([&](cl_event* event) {
        cl_int status = CL_SUCCESS;
        *event = runtime().clCreateUserEvent(handle, &status);
        return status;
    });
    setError(error, result);
    if (result != CL_SUCCESS)
        return nullptr;
    cl_event event = task->events.back();
    runtime().clRetainEvent(event); // the application's reference
    EventRegistry::get().add(event, std::move(type));
    context->worker().poll(GlTaskPtr(task.release()));
    return event;
}

} // namespace glshare
