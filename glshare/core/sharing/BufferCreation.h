// Creates OpenCL memory objects from OpenGL buffers.
#pragma once

#include "core/sharing/SharingContext.h"

#include <memory>

namespace glshare {

// Returns whether `flags` are valid for a memory object that is created from an OpenGL object. 0 is
// valid and means CL_MEM_READ_WRITE.
[[nodiscard]] bool areValidSharingFlags(cl_mem_flags flags) noexcept;

// Implements clCreateFromGLBuffer for a context that shares. The memory object uses the buffer's
// storage in place if devices and renderer allow it, else memory of its own. The caller owns the
// returned reference. Returns null, and sets `error`, on failure.
[[nodiscard]] cl_mem createSharedBuffer(cl_context handle,
                                        const std::shared_ptr<SharingContext>& context,
                                        cl_mem_flags flags, cl_GLuint name, cl_int& error);

} // namespace glshare
