#include "core/sharing/SharingCommands.h"

#include "core/sharing/CopyCommands.h"
#include "core/sharing/Counters.h"
#include "core/sharing/EventRegistry.h"
#include "core/sharing/ObjectRegistry.h"

#include <algorithm>
#include <cstddef>
#include <exception>
#include <memory>
#include <utility>
#include <vector>

namespace glshare {

namespace {

// Returns the error for a handle without a record: it is invalid, or not created from OpenGL.
[[nodiscard]] cl_int errorForUnsharedObject(cl_mem memory)
{
    cl_mem_object_type type = 0;
    if (memory == nullptr || runtime().clGetMemObjectInfo(memory, CL_MEM_TYPE, sizeof type, &type,
                                                          nullptr) != CL_SUCCESS)
        return CL_INVALID_MEM_OBJECT;
    return CL_INVALID_GL_OBJECT;
}

// Appends the records of the request's memory objects, which must belong to `context`.
[[nodiscard]] cl_int findBuffers(const SharingRequest& request,
                                 const std::shared_ptr<SharingContext>& context,
                                 SharedBuffers& buffers)
{
    ObjectRegistry::get().find(request.memory.data(), request.memory.size(), buffers);
    if (buffers.size() < request.memory.size())
        return errorForUnsharedObject(request.memory[buffers.size()]);
    const bool areInContext = std::ranges::all_of(
        buffers, [&](const auto& buffer) { return buffer->context == context; });
    return areInContext ? CL_SUCCESS : CL_INVALID_CONTEXT;
}

// Adds the buffers that must be copied to the batch's items. Returns CL_INVALID_GL_OBJECT if a
// buffer was deleted, or is smaller than its memory object.
[[nodiscard]] cl_int selectCopies(CopyBatch& batch, const GlBufferAccess& gl)
{
    for (const auto& buffer : batch.buffers) {
        const void* storage = buffer->storage.address();
        buffer->isCopied =
            storage == nullptr || gl.hostAddress(buffer->name, buffer->size) != storage;
        if (!buffer->isCopied)
            continue;
        if (gl.bufferSize(buffer->name).value_or(0) < buffer->size)
            return CL_INVALID_GL_OBJECT;
        batch.items.push_back({buffer.get(), buffer->hostAddress()});
    }
    return CL_SUCCESS;
}

// Returns true if no buffer must be copied, as far as the calling thread's context shows. That
// saves two thread switches. If false, the worker's context has to decide.
bool areAllInPlace(const SharingContext& context, const CopyBatch& batch)
{
    const GlBufferAccess::CallerAccess gl = context.worker().callerAccess();
    return std::ranges::all_of(batch.buffers, [&gl](const auto& buffer) {
        const void* storage = buffer->storage.address();
        return storage != nullptr && gl.hostAddress(buffer->name, buffer->size) == storage;
    });
}

[[nodiscard]] cl_int prepareAcquire(const SharingContext& context, bool isOrdered, CopyBatch& batch)
{
    batch.direction = CopyDirection::kFromGl;
    if (isOrdered && areAllInPlace(context, batch)) {
        for (const auto& buffer : batch.buffers)
            buffer->isCopied = false;
        return CL_SUCCESS;
    }
    cl_int result = CL_INVALID_GL_OBJECT;
    context.worker().call([&](GlBufferAccess* gl) {
        if (gl != nullptr)
            result = selectCopies(batch, *gl);
    });
    return result;
}

// Copies the buffers that the acquire has copied.
void prepareRelease(CopyBatch& batch)
{
    batch.direction = CopyDirection::kToGl;
    for (const auto& buffer : batch.buffers) {
        if (buffer->isCopied)
            batch.items.push_back({buffer.get(), buffer->hostAddress()});
    }
}

void updateCounters(SharingCommand command, std::size_t copied, std::size_t inPlace)
{
    if (command == SharingCommand::kAcquire) {
        counters().acquiredByCopy += copied;
        counters().acquiredInPlace += inPlace;
    } else {
        counters().releasedByCopy += copied;
    }
}

// Enqueues the copies, or a marker if every buffer is used in place.
[[nodiscard]] cl_int enqueueCommands(const SharingRequest& request, CopyBatch::Ptr& batch,
                                     cl_event* done)
{
    if (!batch->items.empty())
        return enqueueCopies(request.queue, batch, request.waitList, done);
    return runtime().clEnqueueMarkerWithWaitList(request.queue,
                                                 static_cast<cl_uint>(request.waitList.size()),
                                                 request.waitList.data(), done);
}

cl_command_type commandTypeOf(SharingCommand command)
{
    return command == SharingCommand::kAcquire ? CL_COMMAND_ACQUIRE_GL_OBJECTS
                                               : CL_COMMAND_RELEASE_GL_OBJECTS;
}

// Passes ownership of `done` to the application, or releases it if `event` is null.
void returnEvent(cl_event done, EventRegistry::PreparedEntry type, cl_event* event)
{
    if (event == nullptr) {
        runtime().clReleaseEvent(done);
        return;
    }
    EventRegistry::get().add(done, std::move(type));
    *event = done;
}

[[nodiscard]] cl_int acquireOrRelease(SharingCommand command, const SharingRequest& request,
                                      const SharingContext& context, CopyBatch::Ptr& batch)
{
    const bool isOrdered = context.isOrderedWithCaller();
    // Allocated first, since an enqueued command cannot be taken back.
    EventRegistry::PreparedEntry type;
    if (request.event != nullptr)
        type = EventRegistry::get().prepareEntry(commandTypeOf(command));
    if (command == SharingCommand::kAcquire) {
        if (isOrdered)
            context.worker().finishCaller();
        if (const cl_int error = prepareAcquire(context, isOrdered, *batch); error != CL_SUCCESS)
            return error;
    } else {
        prepareRelease(*batch);
    }
    const std::size_t copied = batch->items.size();
    const std::size_t inPlace = batch->buffers.size() - copied;
    cl_event done = nullptr;
    if (const cl_int error = enqueueCommands(request, batch, &done); error != CL_SUCCESS)
        return error;
    updateCounters(command, copied, inPlace);
    // The wait fails if an earlier command has failed. The event reports that, too.
    if (command == SharingCommand::kRelease && isOrdered)
        static_cast<void>(runtime().clWaitForEvents(1, &done));
    returnEvent(done, std::move(type), request.event);
    return CL_SUCCESS;
}

} // namespace

cl_int enqueueSharing(SharingCommand command, const std::shared_ptr<SharingContext>& context,
                      const SharingRequest& request)
{
    CopyBatch::Ptr batch = CopyBatch::take(context);
    if (const cl_int error = findBuffers(request, context, batch->buffers); error != CL_SUCCESS)
        return error;

    const bool acquired = command == SharingCommand::kAcquire;
    if (!context->setAcquired(batch->buffers, acquired))
        return CL_INVALID_GL_OBJECT;
    cl_int error = CL_OUT_OF_HOST_MEMORY;
    try {
        error = acquireOrRelease(command, request, *context, batch);
    } catch (const std::exception&) {
        // `error` is CL_OUT_OF_HOST_MEMORY.
    }
    if (error != CL_SUCCESS)
        static_cast<void>(context->setAcquired(batch->buffers, !acquired));
    return error;
}

} // namespace glshare
