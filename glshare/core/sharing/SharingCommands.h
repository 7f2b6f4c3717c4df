// clEnqueueAcquireGLObjects and clEnqueueReleaseGLObjects.
#pragma once

#include "core/sharing/SharingContext.h"

#include <memory>
#include <span>

namespace glshare {

enum class SharingCommand { kAcquire, kRelease };

// The arguments of both.
struct SharingRequest {
    cl_command_queue queue;
    std::span<const cl_mem> memory; // not empty
    std::span<const cl_event> waitList;
    cl_event* event; // may be null; the application owns what it gets
};

// Enqueues the command; `context` is the queue's. It never waits for the queue, except where
// cl_khr_gl_event has it ordered against the OpenGL context of the calling thread: then a release
// returns when it is done.
[[nodiscard]] cl_int enqueueSharing(SharingCommand command,
                                    const std::shared_ptr<SharingContext>& context,
                                    const SharingRequest& request);

} // namespace glshare
