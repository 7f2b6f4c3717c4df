#include "core/CopyBatch.h"

#include "core/Counters.h"

#include <cstdint>
#include <exception>
#include <map>
#include <mutex>
#include <utility>

namespace glshare {

namespace {

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

    std::uintptr_t add(const std::shared_ptr<CopyBatch>& batch)
    {
        const std::scoped_lock lock(mutex_);
        std::erase_if(batches_, [](const auto& entry) { return entry.second.expired(); });
        batches_.emplace(++last_, batch);
        return last_;
    }

    // Null if the batch is gone.
    std::shared_ptr<CopyBatch> take(std::uintptr_t number)
    {
        const std::scoped_lock lock(mutex_);
        const auto found = batches_.extract(number);
        return found ? found.mapped().lock() : nullptr;
    }

private:
    std::mutex mutex_; // guards the rest
    std::map<std::uintptr_t, std::weak_ptr<CopyBatch>> batches_;
    std::uintptr_t last_ = 0;
};

// A buffer that is gone by now keeps what it holds: the application broke the rules after the
// command was given, and all that is left is to end well.
void copyAll(const CopyBatch& batch, GlDevice& device)
{
    for (const CopyItem& item : batch.items) {
        const SharedBuffer& buffer = *item.buffer;
        const bool isCopied = batch.direction == CopyDirection::FromGl
                                  ? device.read(buffer.name, item.pointer, buffer.size)
                                  : device.write(buffer.name, item.pointer, buffer.size);
        if (isCopied)
            counters().bytesCopied += buffer.size;
        else
            ++counters().failedCopies;
    }
    if (batch.direction == CopyDirection::ToGl)
        device.finish();
}

SharingContext& contextOf(const CopyBatch& batch)
{
    return *batch.items.front().buffer->context;
}

// On the worker, once the batch is ready with `status`. Runtimes still touch the events of
// commands that failed after they show it, so that those are kept for longer.
void settle(CopyBatch& batch, cl_int status, GlDevice* device)
{
    if (std::exchange(batch.isSettled, true))
        return;
    if (status == CL_COMPLETE && device != nullptr)
        copyAll(batch, *device);
    else if (status == CL_COMPLETE)
        counters().failedCopies += batch.items.size();
    else
        contextOf(batch).keep(std::move(batch.keptIfFailed));
    runtime().clSetUserEventStatus(batch.events->copied.back(), CL_COMPLETE);
}

// Comes on a thread of the runtime's, which must not be kept, nor enter the runtime again.
void CL_CALLBACK onReady(cl_event /*event*/, cl_int status, void* number)
{
    const std::shared_ptr<CopyBatch> batch =
        OutstandingBatches::get().take(reinterpret_cast<std::uintptr_t>(number));
    if (batch == nullptr)
        return;
    const std::shared_ptr<SharingContext> context = batch->items.front().buffer->context;
    try {
        context->worker().post(
            [batch, status](GlDevice* device) { settle(*batch, status, device); });
    } catch (const std::exception&) {
        // The watch sees the status instead.
    }
}

// Runtimes call back late, or not at all when a command fails, so that the worker has a look at
// times.
bool hasEnded(CopyBatch& batch, GlDevice* device)
{
    cl_int status = CL_QUEUED;
    if (!batch.isSettled)
        runtime().clGetEventInfo(batch.ready(), CL_EVENT_COMMAND_EXECUTION_STATUS, sizeof status,
                                 &status, nullptr);
    if (status <= CL_COMPLETE)
        settle(batch, status, device);
    return batch.isSettled;
}

} // namespace

cl_int copyWhenReady(const std::shared_ptr<CopyBatch>& batch)
{
    // The watch is what keeps the batch.
    GlWorker::PreparedWatch watch;
    watch.emplace_back([batch](GlDevice* device) { return hasEnded(*batch, device); });
    const std::uintptr_t number = OutstandingBatches::get().add(batch);
    void* const user = reinterpret_cast<void*>(number); // NOLINT(performance-no-int-to-ptr)
    const cl_int error = runtime().clSetEventCallback(batch->ready(), CL_COMPLETE, onReady, user);
    if (error == CL_SUCCESS)
        contextOf(*batch).worker().watch(std::move(watch));
    return error;
}

} // namespace glshare
