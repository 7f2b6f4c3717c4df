// An acquire or release that copies: its buffers, its events, and the task that makes the copies on
// the worker's thread.
#pragma once

#include "core/sharing/EventList.h"
#include "core/sharing/SharingContext.h"
#include "core/worker/GlTask.h"

#include <chrono>
#include <memory>
#include <vector>

namespace glshare {

enum class CopyDirection { kFromGl, kToGl };

// The events of the commands around the copies.
struct CopyEvents {
    EventList started; // a marker after the wait list
    EventList maps;
    EventList mapped; // a marker after all maps, if there are any
    EventList copied; // a user event, completed by the worker
    EventList unmaps;
    EventList done; // the marker whose event the application gets

    void clear() noexcept;
};

// One buffer to copy.
struct CopyItem {
    const SharedBuffer* buffer;
    void* pointer; // the memory object's host address; null until it is mapped
    bool isMapped = false;
};

// Owned by the thread that enqueues the command, then by the worker. Batches are reused, so that
// later commands allocate nothing.
class CopyBatch final : public GlTask {
public:
    using Ptr = std::unique_ptr<CopyBatch, Deleter>;

    // Returns an empty batch for a command in `context`.
    [[nodiscard]] static Ptr take(std::shared_ptr<SharingContext> context);

    // Returns the event after which each item has its pointer.
    [[nodiscard]] cl_event readyEvent() const noexcept
    {
        return events.mapped.empty() ? events.started.back() : events.mapped.back();
    }

    // Passes the batch to the worker, which copies when readyEvent() completes and then completes
    // `copied`. If readyEvent() fails, `copied` completes without copies. If submit fails, the
    // batch stays the caller's.
    [[nodiscard]] static cl_int submit(Ptr& batch);

    bool run(GlBufferAccess* gl) noexcept override;
    void dispose() noexcept override;

    SharedBuffers buffers;       // all of the command's
    std::vector<CopyItem> items; // the buffers to copy
    CopyDirection direction = CopyDirection::kFromGl;
    CopyEvents events;
    std::vector<cl_event> waitList; // of `done`, while it is enqueued

private:
    void execute(cl_int status, GlBufferAccess* gl) noexcept;
    void copyAll(GlBufferAccess& gl) noexcept;
    [[nodiscard]] bool canBeReleased() noexcept;

    std::shared_ptr<SharingContext> fContext;
    bool fIsExecuted = false; // `copied` has its status
    bool fHasFailed = false;
    std::chrono::steady_clock::time_point fReleaseTime; // the earliest, of a batch that has failed
};

} // namespace glshare
