// Acquires and releases that have to copy: commands in the application's queue around work on the
// GL side.
#pragma once

#include "core/sharing/CopyBatch.h"

#include <span>

namespace glshare {

// Enqueues the copies of a batch with at least one item, after `waitList` and in the order of
// `queue`. Never waits. On success `done` gets an event, owned by the caller, that
// completes after the last copy, and the batch is the worker's; on failure it stays the caller's,
// and nothing is left in the queue that would not complete.
//
//   in the queue   marker ─► (map ─► marker) ─► (unmap) ─► done
//                                       │           ▲
//   the worker                          └─► copies ─┘ (a user event)
//
// What stands in brackets is for memory objects without an address in the host's memory.
[[nodiscard]] cl_int enqueueCopies(cl_command_queue queue, CopyBatch::Ptr& batch,
                                   std::span<const cl_event> waitList, cl_event* done);

} // namespace glshare
