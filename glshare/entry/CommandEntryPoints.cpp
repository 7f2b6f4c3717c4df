// Implements the command and event functions of EntryPoints.h.
#include "core/api/Arguments.h"
#include "core/api/Devices.h"
#include "core/api/Settings.h"
#include "core/sharing/EventRegistry.h"
#include "core/sharing/GlSyncEvents.h"
#include "core/sharing/ObjectRegistry.h"
#include "core/sharing/SharingCommands.h"
#include "entry/EntryPoints.h"

#include <algorithm>
#include <span>

namespace glshare::entry {

namespace {

// The unchecked arguments of acquire and release.
struct CommandArguments {
    cl_command_queue queue;
    cl_uint count;
    const cl_mem* memory;
    cl_uint waitCount;
    const cl_event* waitList;
    cl_event* event;
};

bool isValidWaitList(cl_uint count, const cl_event* list)
{
    return isValidList(count, list) &&
           std::ranges::none_of(std::span(list, count),
                                [](const cl_event event) { return event == nullptr; });
}

// Checks the arguments and enqueues the command. Calls the runtime instead if the queue's context
// is its own.
template <typename CallRuntime>
[[nodiscard]] cl_int enqueue(SharingCommand command, const CommandArguments& arguments,
                             CallRuntime callRuntime)
{
    cl_context handle = nullptr;
    if (arguments.queue == nullptr ||
        runtime().clGetCommandQueueInfo(arguments.queue, CL_QUEUE_CONTEXT, sizeof(cl_context),
                                        &handle, nullptr) != CL_SUCCESS)
        return CL_INVALID_COMMAND_QUEUE;
    const auto context = ObjectRegistry::get().find(handle);
    if (context == nullptr)
        return runtimeSharesNatively(handle) ? callRuntime() : CL_INVALID_CONTEXT;
    if (!isValidList(arguments.count, arguments.memory))
        return CL_INVALID_VALUE;
    if (!isValidWaitList(arguments.waitCount, arguments.waitList))
        return CL_INVALID_EVENT_WAIT_LIST;
    if (arguments.count == 0)
        return CL_SUCCESS;
    return enqueueSharing(command, context,
                          {arguments.queue,
                           {arguments.memory, arguments.count},
                           {arguments.waitList, arguments.waitCount},
                           arguments.event});
}

} // namespace

cl_int CL_API_CALL enqueueAcquireGlObjects(cl_command_queue queue, cl_uint count,
                                           const cl_mem* memory, cl_uint waitCount,
                                           const cl_event* waitList, cl_event* event)
{
    return enqueue(SharingCommand::kAcquire, {queue, count, memory, waitCount, waitList, event},
                   [&] {
                       return runtime().clEnqueueAcquireGLObjects(queue, count, memory, waitCount,
                                                                  waitList, event);
                   });
}

cl_int CL_API_CALL enqueueReleaseGlObjects(cl_command_queue queue, cl_uint count,
                                           const cl_mem* memory, cl_uint waitCount,
                                           const cl_event* waitList, cl_event* event)
{
    return enqueue(SharingCommand::kRelease, {queue, count, memory, waitCount, waitList, event},
                   [&] {
                       return runtime().clEnqueueReleaseGLObjects(queue, count, memory, waitCount,
                                                                  waitList, event);
                   });
}

cl_event CL_API_CALL createEventFromGlSync(cl_context context, cl_GLsync sync, cl_int* error)
{
    const auto sharing = ObjectRegistry::get().find(context);
    if (sharing == nullptr && runtimeSharesNatively(context))
        return runtime().clCreateEventFromGLsyncKHR(context, sync, error);
    cl_event event = nullptr;
    if (sharing == nullptr)
        setError(error, CL_INVALID_CONTEXT);
    else if (!settings().glEvent)
        setError(error, CL_INVALID_OPERATION);
    else
        event = createSyncEvent(context, sharing, reinterpret_cast<GLsync>(sync), error);
    return event;
}

cl_int CL_API_CALL getEventInfo(cl_event event, cl_event_info name, std::size_t size, void* value,
                                std::size_t* sizeNeeded)
{
    if (name == CL_EVENT_COMMAND_TYPE) {
        if (const auto type = EventRegistry::get().findCommandType(event))
            return writeInfoValue(*type, {size, value, sizeNeeded});
    }
    return runtime().clGetEventInfo(event, name, size, value, sizeNeeded);
}

cl_int CL_API_CALL retainEvent(cl_event event)
{
    const cl_int error = runtime().clRetainEvent(event);
    if (error == CL_SUCCESS)
        EventRegistry::get().retain(event);
    return error;
}

// Removes the entry first: after the release the handle may be reused for another event.
cl_int CL_API_CALL releaseEvent(cl_event event)
{
    EventRegistry::get().release(event);
    return runtime().clReleaseEvent(event);
}

// The runtime sees the event of a sync object as a user event, which the application must not
// complete.
cl_int CL_API_CALL setUserEventStatus(cl_event event, cl_int status)
{
    if (EventRegistry::get().findCommandType(event))
        return CL_INVALID_EVENT;
    return runtime().clSetUserEventStatus(event, status);
}

} // namespace glshare::entry
