// An OpenCL memory object that was created from an OpenGL buffer.
#pragma once

#include "core/api/OpenCl.h"
#include "core/sharing/PinnedStorage.h"

#include <cstddef>
#include <memory>
#include <new>

namespace glshare {

class SharingContext;

// A page: no runtime requires a larger alignment for memory that it uses in place.
constexpr std::align_val_t kHostMemoryAlignment{4096};

struct HostMemoryDeleter {
    void operator()(void* memory) const noexcept
    {
        ::operator delete(memory, kHostMemoryAlignment);
    }
};

// Host memory for a memory object, on devices that use it in place.
using HostMemory = std::unique_ptr<void, HostMemoryDeleter>;

// The record of a memory object. The last two fields are guarded by the sharing context; the others
// do not change after creation.
struct SharedBuffer {
    cl_mem memory = nullptr; // borrowed: the record is removed when the runtime destroys it
    std::shared_ptr<SharingContext> context;
    cl_GLuint name = 0;
    std::size_t size = 0; // bytes
    cl_mem_flags flags = 0;
    // The memory that `memory` uses: the OpenGL storage, own host memory, or neither if the runtime
    // has allocated it.
    PinnedStorage storage;
    HostMemory ownMemory;

    // Returns the host address of `memory`; null if the runtime has allocated it.
    [[nodiscard]] void* hostAddress() const noexcept
    {
        return storage.address() != nullptr ? storage.address() : ownMemory.get();
    }

    bool isAcquired = false;
    bool isCopied = false; // by the last acquire; the release then copies, too
};

} // namespace glshare
