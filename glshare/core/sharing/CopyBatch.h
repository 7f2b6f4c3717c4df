// One acquire or release that has to copy: its buffers, its events, and the part of it that is not
// in the queue, which is the worker's copying.
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
    // Where the memory object lies in the host's memory; null until it is mapped, if it has to be.
    void* pointer;
    bool isMapped = false;
};

// Owned by the thread that gives the command, then by the worker. Batches are used again, so that a
// command allocates nothing once there have been some.
class CopyBatch final : public GlTask {
public:
    using Ptr = std::unique_ptr<CopyBatch, Drop>;

    // An empty batch for a command in `context`.
    [[nodiscard]] static Ptr take(std::shared_ptr<SharingContext> context);

    // The event after which each item has its pointer.
    [[nodiscard]] cl_event ready() const
    {
        return events.mapped.empty() ? events.started.back() : events.mapped.back();
    }

    // Has the worker copy when the batch is ready, and complete `copied` then. If `ready` fails,
    // `copied` completes without copies. On failure the batch stays with the caller.
    [[nodiscard]] static cl_int copyWhenReady(Ptr& batch);

    bool run(GlDevice* device) noexcept override;
    void drop() noexcept override;

    SharedBuffers buffers;       // all of the command's
    std::vector<CopyItem> items; // those of them that are copied
    CopyDirection direction = CopyDirection::kFromGl;
    CopyEvents events;
    std::vector<cl_event> waitList; // of `done`, while it is enqueued

private:
    void settle(cl_int status, GlDevice* device) noexcept;
    void copyAll(GlDevice& device) noexcept;
    [[nodiscard]] bool mayBeReleased() noexcept;

    std::shared_ptr<SharingContext> fContext;
    bool fIsSettled = false; // `copied` has its status
    bool fHasFailed = false;
    std::chrono::steady_clock::time_point fEndOfUse; // of the events of a batch that has failed
};

} // namespace glshare
