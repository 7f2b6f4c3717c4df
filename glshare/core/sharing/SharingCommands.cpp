#include "core/sharing/SharingCommands.h"

#include "core/sharing/Copies.h"
#include "core/sharing/Counters.h"
#include "core/sharing/EventTypes.h"
#include "core/sharing/Registry.h"

#include <algorithm>
#include <cstddef>
#include <exception>
#include <memory>
#include <utility>
#include <vector>

namespace glshare {

namespace {

// A handle that is not ours is either bad or an object that has nothing to do with OpenGL.
cl_int errorOfUnknown(cl_mem memory)
{
    cl_mem_object_type type = 0;
    if (memory == nullptr || runtime().clGetMemObjectInfo(memory, CL_MEM_TYPE, sizeof type, &type,
                                                          nullptr) != CL_SUCCESS)
        return CL_INVALID_MEM_OBJECT;
    return CL_INVALID_GL_OBJECT;
}

cl_int findAll(const SharingRequest& request, const std::shared_ptr<SharingContext>& context,
               SharedBuffers& buffers)
{
    Registry::get().find(request.memory.data(), request.memory.size(), buffers);
    if (buffers.size() < request.memory.size())
        return errorOfUnknown(request.memory[buffers.size()]);
    const bool areAllHere = std::ranges::all_of(
        buffers, [&](const auto& buffer) { return buffer->context == context; });
    return areAllHere ? CL_SUCCESS : CL_INVALID_CONTEXT;
}

// Decides for each buffer whether it must be copied, and lists those. CL_INVALID_GL_OBJECT if a
// buffer is gone or has become too small now, when the command is given.
cl_int inspect(CopyBatch& batch, const GlDevice& device)
{
    for (const auto& buffer : batch.buffers) {
        void* const storage = buffer->storage.address();
        buffer->isCopied =
            storage == nullptr || device.address(buffer->name, buffer->size) != storage;
        if (!buffer->isCopied)
            continue;
        if (device.bufferSize(buffer->name).value_or(0) < buffer->size)
            return CL_INVALID_GL_OBJECT;
        batch.items.push_back({buffer.get(), buffer->hostAddress()});
    }
    return CL_SUCCESS;
}

// Whether no buffer must be copied, by a look from the calling thread, which saves two switches to
// the worker's. A false result decides nothing.
bool areAllInPlace(const SharingContext& context, const CopyBatch& batch)
{
    const GlDevice::CallerLook look = context.worker().lookFromCaller();
    return std::ranges::all_of(batch.buffers, [&look](const auto& buffer) {
        void* const storage = buffer->storage.address();
        return storage != nullptr && look.address(buffer->name, buffer->size) == storage;
    });
}

cl_int prepareAcquire(const SharingContext& context, bool isOrdered, CopyBatch& batch)
{
    batch.direction = CopyDirection::kFromGl;
    if (isOrdered && areAllInPlace(context, batch)) {
        for (const auto& buffer : batch.buffers)
            buffer->isCopied = false;
        return CL_SUCCESS;
    }
    cl_int result = CL_INVALID_GL_OBJECT;
    context.worker().call([&](GlDevice* device) {
        if (device != nullptr)
            result = inspect(batch, *device);
    });
    return result;
}

// What was copied on the way in is copied on the way out.
void prepareRelease(CopyBatch& batch)
{
    batch.direction = CopyDirection::kToGl;
    for (const auto& buffer : batch.buffers) {
        if (buffer->isCopied)
            batch.items.push_back({buffer.get(), buffer->hostAddress()});
    }
}

void count(SharingCommand command, std::size_t copied, std::size_t inPlace)
{
    if (command == SharingCommand::kAcquire) {
        counters().acquiredByCopy += copied;
        counters().acquiredInPlace += inPlace;
    } else {
        counters().releasedByCopy += copied;
    }
}

// The commands in the queue. In place nothing has to be done, and the command is a marker.
cl_int enqueue(const SharingRequest& request, CopyBatch::Ptr& batch, cl_event* done)
{
    if (!batch->items.empty())
        return enqueueCopies(request.queue, batch, request.waitList, done);
    return runtime().clEnqueueMarkerWithWaitList(request.queue,
                                                 static_cast<cl_uint>(request.waitList.size()),
                                                 request.waitList.data(), done);
}

cl_command_type typeOf(SharingCommand command)
{
    return command == SharingCommand::kAcquire ? CL_COMMAND_ACQUIRE_GL_OBJECTS
                                               : CL_COMMAND_RELEASE_GL_OBJECTS;
}

// Hands the event to the application, or gives it back if it is not wanted.
void handOver(cl_event done, EventTypes::Prepared type, cl_event* wanted)
{
    if (wanted == nullptr) {
        runtime().clReleaseEvent(done);
        return;
    }
    EventTypes::get().add(done, std::move(type));
    *wanted = done;
}

cl_int acquireOrRelease(SharingCommand command, const SharingRequest& request,
                        const SharingContext& context, CopyBatch::Ptr& batch)
{
    const bool isOrdered = context.isOrderedWithCaller();
    // Allocated before the command is in the queue, which nothing takes back.
    EventTypes::Prepared type;
    if (request.event != nullptr)
        type = EventTypes::get().prepare(typeOf(command));
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
    if (const cl_int error = enqueue(request, batch, &done); error != CL_SUCCESS)
        return error;
    count(command, copied, inPlace);
    // A wait that fails tells of a command before this one, and so will the event.
    if (command == SharingCommand::kRelease && isOrdered)
        static_cast<void>(runtime().clWaitForEvents(1, &done));
    handOver(done, std::move(type), request.event);
    return CL_SUCCESS;
}

} // namespace

cl_int enqueueSharing(SharingCommand command, const std::shared_ptr<SharingContext>& context,
                      const SharingRequest& request)
{
    CopyBatch::Ptr batch = CopyBatch::take(context);
    if (const cl_int error = findAll(request, context, batch->buffers); error != CL_SUCCESS)
        return error;

    const bool acquired = command == SharingCommand::kAcquire;
    if (!context->setAcquired(batch->buffers, acquired))
        return CL_INVALID_GL_OBJECT;
    cl_int error = CL_OUT_OF_HOST_MEMORY;
    try {
        error = acquireOrRelease(command, request, *context, batch);
    } catch (const std::exception&) {
        // As any other failure of the command.
    }
    if (error != CL_SUCCESS)
        static_cast<void>(context->setAcquired(batch->buffers, !acquired));
    return error;
}

} // namespace glshare
