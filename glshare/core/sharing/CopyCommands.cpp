#include "core/sharing/CopyCommands.h"

#include <exception>
#include <utility>
#include <vector>

namespace glshare {

namespace {

[[nodiscard]] cl_int createUserEvent(cl_command_queue queue, EventList& events)
{
    cl_context context = nullptr;
    const cl_int error = runtime().clGetCommandQueueInfo(
        queue, CL_QUEUE_CONTEXT, sizeof(cl_context), static_cast<void*>(&context), nullptr);
    if (error != CL_SUCCESS)
        return error;
    return events.add([&](cl_event* event) {
        cl_int status = CL_SUCCESS;
        *event = runtime().clCreateUserEvent(context, &status);
        return status;
    });
}

[[nodiscard]] cl_int enqueueMarker(cl_command_queue queue, std::span<const cl_event> waitList,
                                   EventList& events)
{
    return events.add([&](cl_event* event) {
        return runtime().clEnqueueMarkerWithWaitList(queue, static_cast<cl_uint>(waitList.size()),
                                                     waitList.data(), event);
    });
}

// Maps the memory objects without a host address. They all wait for one marker, since some runtimes
// take time for each pair of a command and an event of its wait list.
[[nodiscard]] cl_int mapAll(cl_command_queue queue, CopyBatch& batch)
{
    CopyEvents& events = batch.events;
    const cl_map_flags access =
        batch.direction == CopyDirection::kFromGl ? CL_MAP_WRITE : CL_MAP_READ;
    for (CopyItem& item : batch.items) {
        if (item.pointer != nullptr)
            continue;
        const cl_int error = events.maps.add([&](cl_event* event) {
            cl_int status = CL_SUCCESS;
            item.pointer = runtime().clEnqueueMapBuffer(queue, item.buffer->memory, CL_FALSE,
                                                        access, 0, item.buffer->size, 1,
                                                        events.started.data(), event, &status);
            item.isMapped = status == CL_SUCCESS;
            return status;
        });
        if (error != CL_SUCCESS)
            return error;
    }
    return events.maps.empty() ? CL_SUCCESS : enqueueMarker(queue, events.maps, events.mapped);
}

// Unmaps every mapped memory object, also after a failure.
[[nodiscard]] cl_int unmapAll(cl_command_queue queue, CopyBatch& batch)
{
    cl_int result = CL_SUCCESS;
    for (const CopyItem& item : batch.items) {
        if (!item.isMapped)
            continue;
        const cl_int error = batch.events.unmaps.add([&](cl_event* event) {
            return runtime().clEnqueueUnmapMemObject(queue, item.buffer->memory, item.pointer, 1,
                                                     batch.events.copied.data(), event);
        });
        if (error != CL_SUCCESS)
            result = error;
    }
    return result;
}

// The marker waits for the ready event, too, so that it fails if a command before the copies fails.
[[nodiscard]] cl_int enqueueDone(cl_command_queue queue, CopyBatch& batch)
{
    CopyEvents& events = batch.events;
    batch.waitList.assign(events.unmaps.begin(), events.unmaps.end());
    batch.waitList.push_back(events.copied.back());
    batch.waitList.push_back(batch.readyEvent());
    return enqueueMarker(queue, batch.waitList, events.done);
}

[[nodiscard]] cl_int enqueueAll(cl_command_queue queue, CopyBatch& batch,
                                std::span<const cl_event> waitList)
{
    cl_int error = enqueueMarker(queue, waitList, batch.events.started);
    if (error == CL_SUCCESS)
        error = mapAll(queue, batch);
    if (error == CL_SUCCESS)
        error = unmapAll(queue, batch);
    if (error == CL_SUCCESS)
        error = enqueueDone(queue, batch);
    return error;
}

} // namespace

cl_int enqueueCopies(cl_command_queue queue, CopyBatch::Ptr& batch,
                     std::span<const cl_event> waitList, cl_event* done)
{
    batch->events.unmaps.reserve(batch->items.size()); // so that unmapAll does not throw
    cl_int error = createUserEvent(queue, batch->events.copied);
    if (error != CL_SUCCESS)
        return error;
    try {
        error = enqueueAll(queue, *batch, waitList);
    } catch (const std::exception&) {
        error = CL_OUT_OF_HOST_MEMORY;
    }
    if (error == CL_SUCCESS) {
        *done = batch->events.done.back();
        error = runtime().clRetainEvent(*done); // the caller's reference
    }
    // Last, since the worker may complete the user event from then on.
    if (error == CL_SUCCESS) {
        error = CopyBatch::submit(batch);
        if (error == CL_SUCCESS)
            return CL_SUCCESS;
        runtime().clReleaseEvent(*done);
    }
    // Unmaps, unless the unmap commands are enqueued already.
    if (batch->events.unmaps.empty())
        static_cast<void>(unmapAll(queue, *batch));
    runtime().clSetUserEventStatus(batch->events.copied.back(), CL_COMPLETE);
    return error;
}

} // namespace glshare
