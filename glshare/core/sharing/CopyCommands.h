// The commands of an acquire or release that copies.
#pragma once

#include "core/sharing/CopyBatch.h"

#include <span>

namespace glshare {

// Enqueues the copies of a batch with at least one item, after `waitList` and in the order of
// `queue`. Never waits. On success `done` gets an event, owned by the caller, that completes after
// the last copy, and the batch is passed to the worker. On failure the batch stays the caller's,
// and each command that was enqueued completes.
//
//   queue    marker ─► (map ─► marker) ─► (unmap) ─► done
//                                 │           ▲
//   worker                        └─► copies ─┘ (a user event)
//
// The commands in brackets are for memory objects without a host address.
[[nodiscard]] cl_int enqueueCopies(cl_command_queue queue, CopyBatch::Ptr& batch,
                                   std::span<const cl_event> waitList, cl_event* done);

} // namespace glshare
