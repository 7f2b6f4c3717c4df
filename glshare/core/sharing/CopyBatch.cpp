#include "core/sharing/CopyBatch.h"

#include "core/sharing/Counters.h"
#include "core/sharing/EventTypes.h"

#include <algorithm>
#include <utility>

namespace glshare {

namespace {

// Runtimes use the events of commands that fail for a while after they have shown it. Far longer
// than that, as threads may be interrupted.
constexpr std::chrono::milliseconds kUseAfterFailure{100};

bool hasEnded(cl_event event)
{
    cl_int status = CL_COMPLETE; // of an event that cannot be asked
    runtime().clGetEventInfo(event, CL_EVENT_COMMAND_EXECUTION_STATUS, sizeof status, &status,
                             nullptr);
    return status <= CL_COMPLETE;
}

// Comes on a thread of the runtime's, possibly late, or not at all when a command fails.
void CL_CALLBACK onReady(cl_event /*event*/, cl_int /*status*/, void* /*user*/)
{
    GlWorker::lookNow();
}

} // namespace

void CopyEvents::clear() noexcept
{
    for (EventList* events : {&started, &maps, &mapped, &copied, &unmaps, &done})
        events->clear();
}

CopyBatch::Ptr CopyBatch::take(std::shared_ptr<SharingContext> context)
{
    Ptr batch(context->takeBatch().release());
    batch->fContext = std::move(context);
    return batch;
}

cl_int CopyBatch::copyWhenReady(Ptr& batch)
{
    const cl_int error =
        runtime().clSetEventCallback(batch->ready(), CL_COMPLETE, onReady, nullptr);
    if (error != CL_SUCCESS)
        return error;
    GlWorker& worker = batch->fContext->worker();
    worker.watch(std::move(batch));
    return CL_SUCCESS;
}

bool CopyBatch::run(GlDevice* device) noexcept
{
    if (!fIsSettled) {
        cl_int status = CL_QUEUED;
        runtime().clGetEventInfo(ready(), CL_EVENT_COMMAND_EXECUTION_STATUS, sizeof status, &status,
                                 nullptr);
        if (status > CL_COMPLETE)
            return false;
        settle(status, device);
    }
    return hasEnded(events.done.back()) && (!fHasFailed || mayBeReleased());
}

void CopyBatch::settle(cl_int status, GlDevice* device) noexcept
{
    fIsSettled = true;
    fHasFailed = status != CL_COMPLETE;
    if (!fHasFailed && device != nullptr)
        copyAll(*device);
    else if (!fHasFailed)
        counters().failedCopies += items.size();
    fEndOfUse = std::chrono::steady_clock::time_point::max();
    runtime().clSetUserEventStatus(events.copied.back(), CL_COMPLETE);
}

// A buffer that is gone by now keeps what it holds: the application broke the rules after the
// command was given, and all that is left is to end well.
void CopyBatch::copyAll(GlDevice& device) noexcept
{
    const auto copyEach = [this](auto copy) {
        for (const CopyItem& item : items) {
            if (copy(item.buffer->name, item.pointer, item.buffer->size))
                counters().bytesCopied += item.buffer->size;
            else
                ++counters().failedCopies;
        }
    };
    if (direction == CopyDirection::kFromGl) {
        copyEach([&](auto... copy) { return device.read(copy...); });
    } else {
        GlDevice::Writing writing(device);
        copyEach([&](auto... copy) { return writing.write(copy...); });
    }
}

// Of a batch that has failed, once each of its commands has ended and is out of use.
bool CopyBatch::mayBeReleased() noexcept
{
    using Clock = std::chrono::steady_clock;
    if (!std::ranges::all_of(events.unmaps, hasEnded))
        return false;
    fEndOfUse = std::min(fEndOfUse, Clock::now() + kUseAfterFailure);
    return Clock::now() >= fEndOfUse;
}

// Some runtimes use the event of a command that has failed whenever something else ends that the
// command was to wait for. A program that lives with that keeps its event until then; so the other
// events of the batch stay as long as the application's.
void CopyBatch::drop() noexcept
{
    if (std::exchange(fHasFailed, false)) {
        GlTaskPtr self(this);
        if (EventTypes::get().keep(events.done.back(), self))
            return;
        static_cast<void>(self.release());
    }
    events.clear();
    items.clear();
    buffers.clear();
    fIsSettled = false;
    const std::shared_ptr<SharingContext> context = std::move(fContext);
    context->keepBatch(std::unique_ptr<CopyBatch>(this));
}

} // namespace glshare
