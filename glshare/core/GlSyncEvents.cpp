#include "core/GlSyncEvents.h"

#include "core/Answer.h"
#include "core/EventList.h"
#include "core/EventTypes.h"

#include <utility>

namespace glshare {

namespace {

// Looks at the sync object once; true if the event has its final status.
bool settle(cl_event event, GLsync sync, const GlDevice* device)
{
    const bool exists = device != nullptr && device->isSync(sync);
    if (exists && !device->isSignalled(sync))
        return false;
    runtime().clSetUserEventStatus(event, exists ? CL_COMPLETE : CL_INVALID_GL_OBJECT);
    return true;
}

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
    EventTypes::Prepared type = EventTypes::prepare(CL_COMMAND_GL_FENCE_SYNC_OBJECT_KHR);
    const auto events = std::make_shared<EventList>();
    const cl_int result = events->add([&](cl_event* event) {
        cl_int status = CL_SUCCESS;
        *event = runtime().clCreateUserEvent(handle, &status);
        return status;
    });
    setError(error, result);
    if (result != CL_SUCCESS)
        return nullptr;
    // The watch owns a reference to the event, and keeps the context, whose worker runs it.
    context->worker().watch([events, context, sync](const GlDevice* device) {
        return settle(events->back(), sync, device);
    });
    EventTypes::get().add(events->back(), std::move(type));
    runtime().clRetainEvent(events->back()); // the application's reference
    return events->back();
}

} // namespace glshare
