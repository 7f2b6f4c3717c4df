// Implements clEnqueueAcquireGLObjects and clEnqueueReleaseGLObjects.
#pragma once

#include "core/sharing/SharingContext.h"

#include <memory>
#include <span>

namespace glshare {

enum class SharingCommand { kAcquire, kRelease };

// The arguments of both functions.
struct SharingRequest {
    cl_command_queue queue;
    std::span<const cl_mem> memory; // not empty
    std::span<const cl_event> waitList;
    cl_event* event; // may be null; the application owns the returned event
};

// Enqueues the command; `context` is that of the queue. Does not wait for the queue, with one
// exception: if SharingContext::isOrderedWithCaller, a release returns when it is complete.
[[nodiscard]] cl_int enqueueSharing(SharingCommand command,
                                    const std::shared_ptr<SharingContext>& context,
                                    const SharingRequest& request);

} // namespace glshare
