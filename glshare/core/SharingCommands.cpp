#include "core/SharingCommands.h"

#include "core/Copies.h"
#include "core/Counters.h"
#include "core/EventTypes.h"
#include "core/Registry.h"

#include <algorithm>
#include <iterator>
#include <memory>
#include <utility>

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
    buffers = Registry::get().find(request.memory.data(), request.memory.size());
    if (buffers.size() < request.memory.size())
        return errorOfUnknown(request.memory[buffers.size()]);
    const bool areAllHere = std::ranges::all_of(
        buffers, [&](const auto& buffer) { return buffer->context == context; });
    return areAllHere ? CL_SUCCESS : CL_INVALID_CONTEXT;
}

// Decides for each buffer whether it must be copied. What the GL side looks like counts as it is
// now, when the command is given: OpenGL's earlier calls have been made, its later ones must wait
// for the release. CL_INVALID_GL_OBJECT if a buffer is gone or has become too small.
cl_int inspect(const SharingContext& context, const SharedBuffers& buffers)
{
    cl_int result = CL_SUCCESS;
    context.worker().call([&](GlDevice* device) {
        for (const auto& buffer : buffers) {
            if (device == nullptr) {
                result = CL_INVALID_GL_OBJECT;
                return;
            }
            buffer->isCopied = buffer->storage == nullptr ||
                               device->address(buffer->name, buffer->size) != buffer->storage;
            if (buffer->isCopied && device->bufferSize(buffer->name).value_or(0) < buffer->size) {
                result = CL_INVALID_GL_OBJECT;
                return;
            }
        }
    });
    return result;
}

void count(SharingCommand command, std::size_t copied, std::size_t inPlace)
{
    if (command == SharingCommand::Acquire) {
        counters().acquiredByCopy += copied;
        counters().acquiredInPlace += inPlace;
    } else {
        counters().releasedByCopy += copied;
    }
}

// The commands in the queue. In place nothing has to be done, and the command is a marker.
cl_int enqueue(SharingCommand command, const SharingRequest& request, const SharedBuffers& buffers,
               cl_event* done)
{
    SharedBuffers copied;
    std::ranges::copy_if(buffers, std::back_inserter(copied),
                         [](const auto& buffer) { return buffer->isCopied; });
    const std::size_t copies = copied.size();
    const cl_int error =
        copied.empty()
            ? runtime().clEnqueueMarkerWithWaitList(request.queue,
                                                    static_cast<cl_uint>(request.waitList.size()),
                                                    request.waitList.data(), done)
            : enqueueCopies(request.queue, std::move(copied),
                            command == SharingCommand::Acquire ? CopyDirection::FromGl
                                                               : CopyDirection::ToGl,
                            request.waitList, done);
    if (error == CL_SUCCESS)
        count(command, copies, buffers.size() - copies);
    return error;
}

// Hands the event to the application, or gives it back if it is not wanted.
void handOver(cl_event done, SharingCommand command, cl_event* wanted)
{
    if (wanted == nullptr) {
        runtime().clReleaseEvent(done);
        return;
    }
    EventTypes::get().add(done, command == SharingCommand::Acquire ? CL_COMMAND_ACQUIRE_GL_OBJECTS
                                                                   : CL_COMMAND_RELEASE_GL_OBJECTS);
    *wanted = done;
}

cl_int acquireOrRelease(SharingCommand command, const SharingRequest& request,
                        const SharingContext& context, const SharedBuffers& buffers)
{
    const bool isOrdered = context.isOrderedWithCaller();
    if (command == SharingCommand::Acquire) {
        if (isOrdered)
            context.worker().finishCaller();
        if (const cl_int error = inspect(context, buffers); error != CL_SUCCESS)
            return error;
    }
    cl_event done = nullptr;
    if (const cl_int error = enqueue(command, request, buffers, &done); error != CL_SUCCESS)
        return error;
    // A wait that fails tells of a command before this one, and so will the event.
    if (command == SharingCommand::Release && isOrdered)
        static_cast<void>(runtime().clWaitForEvents(1, &done));
    handOver(done, command, request.event);
    return CL_SUCCESS;
}

} // namespace

cl_int enqueueSharing(SharingCommand command, const std::shared_ptr<SharingContext>& context,
                      const SharingRequest& request)
{
    SharedBuffers buffers;
    if (const cl_int error = findAll(request, context, buffers); error != CL_SUCCESS)
        return error;

    const bool acquired = command == SharingCommand::Acquire;
    if (!context->setAcquired(buffers, acquired))
        return CL_INVALID_GL_OBJECT;
    const cl_int error = acquireOrRelease(command, request, *context, buffers);
    if (error != CL_SUCCESS)
        static_cast<void>(context->setAcquired(buffers, !acquired));
    return error;
}

} // namespace glshare
