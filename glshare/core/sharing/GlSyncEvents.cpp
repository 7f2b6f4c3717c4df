#include "core/sharing/GlSyncEvents.h"

#include "core/api/Answer.h"
#include "core/sharing/EventList.h"
#include "core/sharing/EventTypes.h"

#include <utility>

namespace glshare {

namespace {

// Completes an event when a sync object is signalled. Keeps the context, whose worker runs it.
class SyncWatch final : public GlTask {
public:
    SyncWatch(std::shared_ptr<SharingContext> context, GLsync sync)
        : fContext(std::move(context)), fSync(sync)
    {
    }

    bool run(GlDevice* device) noexcept override
    {
        const bool exists = device != nullptr && device->isSync(fSync);
        if (exists && !device->isSignalled(fSync))
            return false;
        runtime().clSetUserEventStatus(events.back(), exists ? CL_COMPLETE : CL_INVALID_GL_OBJECT);
        return true;
    }

    EventList events; // the one event

private:
    std::shared_ptr<SharingContext> fContext;
    GLsync fSync;
};

} // namespace

cl_event createSyncEvent(cl_context handle, const std::shared_ptr<SharingContext>& context,
                         GLsync sync, cl_int* error)
{
    bool isSync = false;
    context->worker().call([&](const GlDevice* device) {
        isSync = device != nullptr && sync != nullptr && device->isSync(sync);
    });
    if (!isSync) {
        setError(error, CL_INVALID_GL_OBJECT);
        return nullptr;
    }
    EventTypes::Prepared type = EventTypes::get().prepare(CL_COMMAND_GL_FENCE_SYNC_OBJECT_KHR);
    auto watch = std::make_unique<SyncWatch>(context, sync);
    const cl_int result = watch->events.add([&](cl_event* event) {
        cl_int status = CL_SUCCESS;
        *event = runtime().clCreateUserEvent(handle, &status);
        return status;
    });
    setError(error, result);
    if (result != CL_SUCCESS)
        return nullptr;
    cl_event event = watch->events.back();
    runtime().clRetainEvent(event); // the application's reference
    EventTypes::get().add(event, std::move(type));
    context->worker().watch(GlTaskPtr(watch.release()));
    return event;
}

} // namespace glshare
