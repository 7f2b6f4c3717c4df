// Acquires and releases that have to copy: commands in the application's queue around work on the
// GL side.
#pragma once

#include "core/CopyBatch.h"

#include <span>
#include <vector>

namespace glshare {

// Enqueues the copies of `items`, which is not empty and of one context, after `waitList` and in
// the order of `queue`. Never waits. On success `done` gets an event, owned by the caller, that
// completes after the last copy; on failure nothing is left in the queue that would not complete.
//
//   in the queue   marker ─► (map ─► marker) ─► (unmap) ─► done
//                                       │           ▲
//   the worker                          └─► copies ─┘ (a user event)
//
// What stands in brackets is for memory objects without an address in the host's memory.
[[nodiscard]] cl_int enqueueCopies(cl_command_queue queue, std::vector<CopyItem> items,
                                   CopyDirection direction, std::span<const cl_event> waitList,
                                   cl_event* done);

} // namespace glshare
