#include "core/Copies.h"

#include "core/Counters.h"

#include <cstddef>
#include <cstdint>
#include <map>
#include <memory>
#include <mutex>
#include <utility>
#include <vector>

namespace glshare {

namespace {

// Owns the references of a list of events.
class Events {
public:
    Events() = default;
    ~Events()
    {
        for (cl_event event : events_)
            runtime().clReleaseEvent(event);
    }
    Events(const Events&) = delete;
    Events& operator=(const Events&) = delete;

    // For a call that stores an event: a place at the end of the list, kept if the call succeeds.
    template <typename Call>
    cl_int add(Call call)
    {
        cl_event event = nullptr;
        const cl_int error = call(&event);
        if (error == CL_SUCCESS)
            events_.push_back(event);
        return error;
    }

    [[nodiscard]] cl_uint count() const { return static_cast<cl_uint>(events_.size()); }
    [[nodiscard]] const cl_event* data() const { return events_.data(); }

private:
    std::vector<cl_event> events_;
};

// One batch of copies, from its commands to the end of its work.
struct Batch {
    SharedBuffers buffers;
    std::vector<void*> mapped; // where each buffer lies while it is mapped
    CopyDirection direction;
    cl_event copied = nullptr; // the user event; owned
    // All are held until the batch is settled, since runtimes still touch the events of commands
    // that failed.
    Events maps;
    Events allMapped; // one marker
    Events unmaps;
    bool isSettled = false; // the user event has its status; the worker's alone

    ~Batch()
    {
        if (copied != nullptr)
            runtime().clReleaseEvent(copied);
    }
};

using BatchPointer = std::shared_ptr<Batch>;

// The batches whose callback is outstanding, by number: it may come late, or never, and then finds
// nothing. Safe from any thread.
class OutstandingBatches {
public:
    // Never destroyed, as a callback may come while the process exits.
    static OutstandingBatches& get()
    {
        static auto* const theBatches = new OutstandingBatches;
        return *theBatches;
    }

    std::uintptr_t add(const BatchPointer& batch)
    {
        const std::scoped_lock lock(mutex_);
        std::erase_if(batches_, [](const auto& entry) { return entry.second.expired(); });
        batches_.emplace(++last_, batch);
        return last_;
    }

    // Null if the batch is gone.
    BatchPointer take(std::uintptr_t number)
    {
        const std::scoped_lock lock(mutex_);
        const auto found = batches_.extract(number);
        return found ? found.mapped().lock() : nullptr;
    }

private:
    std::mutex mutex_; // guards the rest
    std::map<std::uintptr_t, std::weak_ptr<Batch>> batches_;
    std::uintptr_t last_ = 0;
};

bool copy(GlDevice& device, const SharedBuffer& buffer, void* mapped, CopyDirection direction)
{
    return direction == CopyDirection::FromGl ? device.read(buffer.name, mapped, buffer.size)
                                              : device.write(buffer.name, mapped, buffer.size);
}

// A buffer that is gone by now keeps what it holds: the application broke the rules after the
// command was given, and all that is left is to end well.
void copyAll(const Batch& batch, GlDevice* device)
{
    for (std::size_t i = 0; i < batch.buffers.size(); ++i) {
        const SharedBuffer& buffer = *batch.buffers[i];
        if (device != nullptr && copy(*device, buffer, batch.mapped[i], batch.direction))
            counters().bytesCopied += buffer.size;
        else
            ++counters().failedCopies;
    }
}

// On the worker, once the commands before the copies have ended with `status`. If they have failed,
// only the unmapping is left to do.
void settle(Batch& batch, cl_int status, GlDevice* device)
{
    if (std::exchange(batch.isSettled, true))
        return;
    if (status == CL_COMPLETE)
        copyAll(batch, device);
    runtime().clSetUserEventStatus(batch.copied, CL_COMPLETE);
}

// Comes on a thread of the runtime's, which must not be kept, nor enter the runtime again.
void CL_CALLBACK onMapped(cl_event /*event*/, cl_int status, void* number)
{
    const BatchPointer batch =
        OutstandingBatches::get().take(reinterpret_cast<std::uintptr_t>(number));
    if (batch == nullptr)
        return;
    const std::shared_ptr<SharingContext> context = batch->buffers.front()->context;
    context->worker().post([batch, status](GlDevice* device) { settle(*batch, status, device); });
}

// Not every runtime calls back when a command fails, so that the worker has a look at times. The
// watch is what keeps the batch.
bool hasEnded(Batch& batch, GlDevice* device)
{
    cl_int status = CL_QUEUED;
    if (!batch.isSettled)
        runtime().clGetEventInfo(*batch.allMapped.data(), CL_EVENT_COMMAND_EXECUTION_STATUS,
                                 sizeof status, &status, nullptr);
    if (status < 0)
        settle(batch, status, device);
    return batch.isSettled;
}

cl_int mapAll(cl_command_queue queue, Batch& batch, std::span<const cl_event> waitList)
{
    const cl_map_flags access =
        batch.direction == CopyDirection::FromGl ? CL_MAP_WRITE : CL_MAP_READ;
    for (const auto& buffer : batch.buffers) {
        const cl_int error = batch.maps.add([&](cl_event* event) {
            cl_int status = CL_SUCCESS;
            void* mapped = runtime().clEnqueueMapBuffer(
                queue, buffer->memory, CL_FALSE, access, 0, buffer->size,
                static_cast<cl_uint>(waitList.size()), waitList.data(), event, &status);
            if (status == CL_SUCCESS)
                batch.mapped.push_back(mapped);
            return status;
        });
        if (error != CL_SUCCESS)
            return error;
    }
    return CL_SUCCESS;
}

cl_int unmapAll(cl_command_queue queue, Batch& batch)
{
    cl_int result = CL_SUCCESS;
    for (std::size_t i = 0; i < batch.mapped.size(); ++i) {
        const cl_int error = batch.unmaps.add([&](cl_event* event) {
            return runtime().clEnqueueUnmapMemObject(queue, batch.buffers[i]->memory,
                                                     batch.mapped[i], 1, &batch.copied, event);
        });
        if (error != CL_SUCCESS)
            result = error;
    }
    return result;
}

// The commands after the maps. The last one waits for the maps too, so that it fails if they do.
// The callback comes at the end: until it is set, the caller alone decides about the user event.
cl_int enqueueRest(cl_command_queue queue, const BatchPointer& batch, cl_event* done)
{
    cl_int error = batch->allMapped.add([&](cl_event* event) {
        return runtime().clEnqueueMarkerWithWaitList(queue, batch->maps.count(), batch->maps.data(),
                                                     event);
    });
    if (error == CL_SUCCESS)
        error = unmapAll(queue, *batch);
    if (error != CL_SUCCESS)
        return error;
    std::vector<cl_event> all(batch->unmaps.data(), batch->unmaps.data() + batch->unmaps.count());
    all.push_back(*batch->allMapped.data());
    error = runtime().clEnqueueMarkerWithWaitList(queue, static_cast<cl_uint>(all.size()),
                                                  all.data(), done);
    if (error != CL_SUCCESS)
        return error;
    const std::uintptr_t number = OutstandingBatches::get().add(batch);
    error = runtime().clSetEventCallback(
        *batch->allMapped.data(), CL_COMPLETE, onMapped,
        reinterpret_cast<void*>(number)); // NOLINT(performance-no-int-to-ptr)
    if (error != CL_SUCCESS)
        runtime().clReleaseEvent(std::exchange(*done, nullptr)); // the caller gets none
    return error;
}

} // namespace

cl_int enqueueCopies(cl_command_queue queue, SharedBuffers buffers, CopyDirection direction,
                     std::span<const cl_event> waitList, cl_event* done)
{
    cl_context handle = nullptr;
    cl_int error = runtime().clGetCommandQueueInfo(queue, CL_QUEUE_CONTEXT, sizeof(cl_context),
                                                   &handle, nullptr);
    if (error != CL_SUCCESS)
        return error;
    const auto batch = std::make_shared<Batch>();
    batch->buffers = std::move(buffers);
    batch->direction = direction;
    batch->copied = runtime().clCreateUserEvent(handle, &error);
    if (error != CL_SUCCESS)
        return error;

    error = mapAll(queue, *batch, waitList);
    if (error == CL_SUCCESS)
        error = enqueueRest(queue, batch, done);
    if (error == CL_SUCCESS) {
        batch->buffers.front()->context->worker().watch(
            [batch](GlDevice* device) { return hasEnded(*batch, device); });
        return CL_SUCCESS;
    }
    // What was mapped is unmapped again, if that is not in the queue already.
    if (batch->unmaps.count() == 0)
        static_cast<void>(unmapAll(queue, *batch));
    runtime().clSetUserEventStatus(batch->copied, CL_COMPLETE);
    return error;
}

} // namespace glshare
