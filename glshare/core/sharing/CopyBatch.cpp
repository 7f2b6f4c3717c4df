#include "core/sharing/CopyBatch.h"

#include "core/sharing/Counters.h"
#include "core/sharing/EventRegistry.h"

#include <algorithm>
#include <utility>

namespace glshare {

namespace {

// How long the events of a failed command are kept: runtimes use them for a moment after they have
// reported the failure. Much longer than that moment, since threads may be preempted.
constexpr std::chrono::milliseconds kEventUseAfterFailure{100};

bool hasEnded(cl_event event)
{
    cl_int status = CL_COMPLETE; // if the query fails
    runtime().clGetEventInfo(event, CL_EVENT_COMMAND_EXECUTION_STATUS, sizeof status, &status,
                             nullptr);
    return status <= CL_COMPLETE;
}

// Called on a thread of the runtime, possibly late, or never if the command fails: the worker
// polls, too.
void CL_CALLBACK onReady(cl_event /*event*/, cl_int /*status*/, void* /*user*/)
{
    GlWorker::pollNow();
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

cl_int CopyBatch::submit(Ptr& batch)
{
    const cl_int error =
        runtime().clSetEventCallback(batch->readyEvent(), CL_COMPLETE, onReady, nullptr);
    if (error != CL_SUCCESS)
        return error;
    GlWorker& worker = batch->fContext->worker();
    worker.poll(std::move(batch));
    return CL_SUCCESS;
}

bool CopyBatch::run(GlBufferAccess* gl) noexcept
{
    if (!fIsExecuted) {
        cl_int status = CL_QUEUED;
        runtime().clGetEventInfo(readyEvent(), CL_EVENT_COMMAND_EXECUTION_STATUS, sizeof status,
                                 &status, nullptr);
        if (status > CL_COMPLETE)
            return false;
        execute(status, gl);
    }
    return hasEnded(events.done.back()) && (!fHasFailed || canBeReleased());
}

void CopyBatch::execute(cl_int status, GlBufferAccess* gl) noexcept
{
    fIsExecuted = true;
    fHasFailed = status != CL_COMPLETE;
    if (!fHasFailed && gl != nullptr)
        copyAll(*gl);
    else if (!fHasFailed)
        counters().failedCopies += items.size();
    fReleaseTime = std::chrono::steady_clock::time_point::max();
    runtime().clSetUserEventStatus(events.copied.back(), CL_COMPLETE);
}

// A copy fails if the application has deleted or mapped the buffer since it enqueued the command.
// That violates the extension, and only the counters report it.
void CopyBatch::copyAll(GlBufferAccess& gl) noexcept
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
        copyEach([&](auto... copy) { return gl.read(copy...); });
    } else {
        GlBufferAccess::WriteScope scope(gl);
        copyEach([&](auto... copy) { return scope.write(copy...); });
    }
}

// Returns whether each command of a failed batch has ended, and its events are no longer used.
bool CopyBatch::canBeReleased() noexcept
{
    using Clock = std::chrono::steady_clock;
    if (!std::ranges::all_of(events.unmaps, hasEnded))
        return false;
    fReleaseTime = std::min(fReleaseTime, Clock::now() + kEventUseAfterFailure);
    return Clock::now() >= fReleaseTime;
}

// Some runtimes use the event of a failed command once more when the other events of its wait list
// complete. An application that is safe on them keeps its event until then. The batch is attached
// to that event, so that the batch's other events live as long.
void CopyBatch::dispose() noexcept
{
    if (std::exchange(fHasFailed, false)) {
        GlTaskPtr self(this);
        if (EventRegistry::get().attach(events.done.back(), self))
            return;
        static_cast<void>(self.release());
    }
    events.clear();
    items.clear();
    buffers.clear();
    fIsExecuted = false;
    const std::shared_ptr<SharingContext> context = std::move(fContext);
    context->returnBatch(std::unique_ptr<CopyBatch>(this));
}

} // namespace glshare
