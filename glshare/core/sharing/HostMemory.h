// Memory of our own for OpenCL memory objects, on devices that work in the host's memory.
#pragma once

#include <cstddef>
#include <memory>
#include <new>

namespace glshare {

// A page: runtimes that need an alignment to use memory in place need no more.
constexpr std::align_val_t kHostMemoryAlignment{4096};

struct FreeHostMemory {
    void operator()(void* memory) const { ::operator delete(memory, kHostMemoryAlignment); }
};

using HostMemory = std::unique_ptr<void, FreeHostMemory>;

// At least `size` bytes, not initialised. Throws std::bad_alloc.
inline HostMemory allocateHostMemory(std::size_t size)
{
    constexpr std::size_t kCacheLine = 64; // devices may read and write whole ones
    const std::size_t padded = (size + kCacheLine - 1) / kCacheLine * kCacheLine;
    return HostMemory(::operator new(padded, kHostMemoryAlignment));
}

} // namespace glshare
