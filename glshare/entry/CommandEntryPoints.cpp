// Implements the commands and events of EntryPoints.h.
#include "core/api/Answer.h"
#include "core/api/Devices.h"
#include "core/api/Switches.h"
#include "core/sharing/EventTypes.h"
#include "core/sharing/GlSyncEvents.h"
#include "core/sharing/Registry.h"
#include "core/sharing/SharingCommands.h"
#include "entry/EntryPoints.h"

#include <algorithm>
#include <span>

namespace glshare::entry {

namespace {

// The arguments of acquire and release as they come.
struct RawRequest {
    cl_command_queue queue;
    cl_uint count;
    const cl_mem* memory;
    cl_uint waitCount;
    const cl_event* waitList;
    cl_event* event;
};

bool isWaitList(cl_uint count, const cl_event* list)
{
    return isList(count, list) &&
           std::ranges::none_of(std::span(list, count),
                                [](const cl_event event) { return event == nullptr; });
}

template <typename PassDown>
cl_int share(SharingCommand command, const RawRequest& raw, PassDown passDown)
{
    cl_context handle = nullptr;
    if (raw.queue == nullptr ||
        runtime().clGetCommandQueueInfo(raw.queue, CL_QUEUE_CONTEXT, sizeof(cl_context), &handle,
                                        nullptr) != CL_SUCCESS)
        return CL_INVALID_COMMAND_QUEUE;
    const auto context = Registry::get().find(handle);
    if (context == nullptr)
        return runtimeShares(handle) ? passDown() : CL_INVALID_CONTEXT;
    if (!isList(raw.count, raw.memory))
        return CL_INVALID_VALUE;
    if (!isWaitList(raw.waitCount, raw.waitList))
        return CL_INVALID_EVENT_WAIT_LIST;
    if (raw.count == 0)
        return CL_SUCCESS;
    return enqueueSharing(
        command, context,
        {raw.queue, {raw.memory, raw.count}, {raw.waitList, raw.waitCount}, raw.event});
}

} // namespace

cl_int CL_API_CALL enqueueAcquireGlObjects(cl_command_queue queue, cl_uint count,
                                           const cl_mem* memory, cl_uint waitCount,
                                           const cl_event* waitList, cl_event* event)
{
    return share(SharingCommand::kAcquire, {queue, count, memory, waitCount, waitList, event}, [&] {
        return runtime().clEnqueueAcquireGLObjects(queue, count, memory, waitCount, waitList,
                                                   event);
    });
}

cl_int CL_API_CALL enqueueReleaseGlObjects(cl_command_queue queue, cl_uint count,
                                           const cl_mem* memory, cl_uint waitCount,
                                           const cl_event* waitList, cl_event* event)
{
    return share(SharingCommand::kRelease, {queue, count, memory, waitCount, waitList, event}, [&] {
        return runtime().clEnqueueReleaseGLObjects(queue, count, memory, waitCount, waitList,
                                                   event);
    });
}

cl_event CL_API_CALL createEventFromGlSync(cl_context context, cl_GLsync sync, cl_int* error)
{
    const auto sharing = Registry::get().find(context);
    if (sharing == nullptr && runtimeShares(context))
        return runtime().clCreateEventFromGLsyncKHR(context, sync, error);
    cl_event event = nullptr;
    if (sharing == nullptr)
        setError(error, CL_INVALID_CONTEXT);
    else if (!switches().glEvent)
        setError(error, CL_INVALID_OPERATION);
    else
        event = createSyncEvent(context, sharing, reinterpret_cast<GLsync>(sync), error);
    return event;
}

cl_int CL_API_CALL getEventInfo(cl_event event, cl_event_info name, std::size_t size, void* value,
                                std::size_t* sizeNeeded)
{
    if (name == CL_EVENT_COMMAND_TYPE) {
        if (const auto type = EventTypes::get().find(event))
            return answerWith(*type, {size, value, sizeNeeded});
    }
    return runtime().clGetEventInfo(event, name, size, value, sizeNeeded);
}

cl_int CL_API_CALL retainEvent(cl_event event)
{
    const cl_int error = runtime().clRetainEvent(event);
    if (error == CL_SUCCESS)
        EventTypes::get().retain(event);
    return error;
}

// Our own record goes first: afterwards the handle may be another event's.
cl_int CL_API_CALL releaseEvent(cl_event event)
{
    EventTypes::get().release(event);
    return runtime().clReleaseEvent(event);
}

// An event that stands for a GL sync object is a user event below, but not the application's to
// set.
cl_int CL_API_CALL setUserEventStatus(cl_event event, cl_int status)
{
    if (EventTypes::get().find(event))
        return CL_INVALID_EVENT;
    return runtime().clSetUserEventStatus(event, status);
}

} // namespace glshare::entry
