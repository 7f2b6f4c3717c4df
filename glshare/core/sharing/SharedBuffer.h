// An OpenCL memory object made from an OpenGL buffer.
#pragma once

#include "core/api/OpenCl.h"
#include "core/sharing/HostMemory.h"
#include "core/sharing/PinnedStorage.h"

#include <cstddef>
#include <memory>

namespace glshare {

class SharingContext;

// Everything but the last two fields is fixed once the object exists; those are guarded by the
// sharing context.
struct SharedBuffer {
    cl_mem memory = nullptr; // the runtime's own object, borrowed: this record ends with it
    std::shared_ptr<SharingContext> context;
    cl_GLuint name = 0;
    std::size_t size = 0; // bytes
    cl_mem_flags flags = 0;
    // What `memory` lies over: the GL storage, memory of our own, or, with neither, memory of the
    // runtime's.
    PinnedStorage storage;
    HostMemory ownMemory;

    // Where `memory` lies in the host's memory; null if it is the runtime's.
    [[nodiscard]] void* hostAddress() const
    {
        return storage.address() != nullptr ? storage.address() : ownMemory.get();
    }

    bool isAcquired = false;
    bool isCopied = false; // how it was acquired; the release goes the same way
};

} // namespace glshare
