// Implements clCreateEventFromGLsyncKHR.
#pragma once

#include "core/sharing/SharingContext.h"

#include <memory>

namespace glshare {

// Returns an event, owned by the caller, that completes once `sync` is signalled. `sync` must have
// been flushed, and must exist until then: if it is deleted first, the event fails with
// CL_INVALID_GL_OBJECT. Returns null, and sets `error` unless that is null, on failure.
[[nodiscard]] cl_event createSyncEvent(cl_context handle,
                                       const std::shared_ptr<SharingContext>& context, GLsync sync,
                                       cl_int* error);

} // namespace glshare
