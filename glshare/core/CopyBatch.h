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
    EventList maps;
    EventList mapped; // one marker, after all maps
    EventList copied; // one user event, completed by the worker
    EventList unmaps;
    EventList done; // the marker whose event the application gets
};

// One buffer to copy.
struct CopyItem {
    std::shared_ptr<SharedBuffer> buffer;
    // The buffer's storage at the time of the command, which the copy then needs no OpenGL for; if
    // nothing is held, the copy goes by the buffer's name.
    StorageHold storage;
    void* pointer = nullptr; // where the memory object lies while it is mapped
};

struct CopyBatch {
    std::vector<CopyItem> items; // not empty, and of one context
    CopyDirection direction = CopyDirection::FromGl;
    std::shared_ptr<CopyEvents> events = std::make_shared<CopyEvents>();
    SharingContext::Kept keptIfFailed{events};
    bool isSettled = false; // `copied` has its status; touched by the worker alone
};

// Has the worker copy when `mapped` is complete, and complete `copied` then. If `mapped` fails,
// `copied` completes without copies. On failure nothing will be done, and `copied` is the caller's.
[[nodiscard]] cl_int copyWhenMapped(const std::shared_ptr<CopyBatch>& batch);

} // namespace glshare
