#include "core/GlSyncEvents.h"

#include "core/Answer.h"
#include "core/EventTypes.h"

namespace glshare {

namespace {

// Looks at the sync object once; true if the event has its final status. The watch has a reference
// to the event of its own, which it gives back then.
bool settle(cl_event event, GLsync sync, const GlDevice* device)
{
    const bool exists = device != nullptr && device->isSync(sync);
    if (exists && !device->isSignalled(sync))
        return false;
    runtime().clSetUserEventStatus(event, exists ? CL_COMPLETE : CL_INVALID_GL_OBJECT);
    runtime().clReleaseEvent(event);
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
    cl_int result = CL_SUCCESS;
    cl_event event = runtime().clCreateUserEvent(handle, &result);
    if (event != nullptr) {
        EventTypes::get().add(event, CL_COMMAND_GL_FENCE_SYNC_OBJECT_KHR);
        runtime().clRetainEvent(event); // the watch's, see settle
        context->worker().watch(
            [event, sync](const GlDevice* device) { return settle(event, sync, device); });
    }
    setError(error, result);
    return event;
}

} // namespace glshare
