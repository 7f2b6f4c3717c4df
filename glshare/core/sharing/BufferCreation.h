// Makes OpenCL memory objects from OpenGL buffers.
#pragma once

#include "core/sharing/SharingContext.h"

#include <memory>

namespace glshare {

// Whether `flags` are valid for an object that is made from one of OpenGL's. 0 is, and means
// CL_MEM_READ_WRITE.
[[nodiscard]] bool areSharingFlags(cl_mem_flags flags);

// clCreateFromGLBuffer, for a context that shares. The memory object lies over the buffer's own
// storage where devices and renderer allow it, and has storage of its own elsewhere. The caller
// owns the one reference; null, and the reason in `error`, on failure.
[[nodiscard]] cl_mem createSharedBuffer(cl_context handle,
                                        const std::shared_ptr<SharingContext>& context,
                                        cl_mem_flags flags, cl_GLuint name, cl_int& error);

} // namespace glshare
