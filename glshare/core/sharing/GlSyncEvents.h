// clCreateEventFromGLsyncKHR.
#pragma once

#include "core/sharing/SharingContext.h"

#include <memory>

namespace glshare {

// An event, owned by the caller, that completes once `sync` is signalled. The sync object must have
// been flushed and must live until then: if it is deleted first, the event fails with
// CL_INVALID_GL_OBJECT. Null, and the reason in `error` (which may be null), on failure.
[[nodiscard]] cl_event createSyncEvent(cl_context handle,
                                       const std::shared_ptr<SharingContext>& context, GLsync sync,
                                       cl_int* error);

} // namespace glshare
