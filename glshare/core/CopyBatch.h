// The part of a batch of copies that is not in the queue: waiting for the buffers to be mapped, and
// the worker's copying.
#pragma once

#include "core/EventList.h"
#include "core/SharingContext.h"

#include <memory>
#include <vector>

namespace glshare {

enum class CopyDirection { FromGl, ToGl };

// The events of the commands around the copies.
struct CopyEvents {
    EventList started; // a marker after the wait list
    EventList maps;
    EventList mapped; // a marker after all maps, if there are any
    EventList copied; // a user event, completed by the worker
    EventList unmaps;
    EventList done; // the marker whose event the application gets
};

// One buffer to copy.
struct CopyItem {
    std::shared_ptr<SharedBuffer> buffer;
    // Where the memory object lies in the host's memory; null until it is mapped, if it has to be.
    void* pointer = nullptr;
    bool isMapped = false;
};

struct CopyBatch {
    std::vector<CopyItem> items; // not empty, and of one context
    CopyDirection direction = CopyDirection::FromGl;
    std::shared_ptr<CopyEvents> events = std::make_shared<CopyEvents>();
    SharingContext::Kept keptIfFailed{events};
    bool isSettled = false; // `copied` has its status; touched by the worker alone

    // The event after which each item has its pointer.
    [[nodiscard]] cl_event ready() const
    {
        return events->mapped.empty() ? events->started.back() : events->mapped.back();
    }
};

// Has the worker copy when the batch is ready, and complete `copied` then. If `ready` fails,
// `copied` completes without copies. On failure nothing will be done, and `copied` is the caller's.
[[nodiscard]] cl_int copyWhenReady(const std::shared_ptr<CopyBatch>& batch);

} // namespace glshare
