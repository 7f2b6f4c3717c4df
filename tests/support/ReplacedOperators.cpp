#include "ReplacedOperators.h"

#include <cstdlib>
#include <new>

#ifdef _WIN32
#include <malloc.h>
#endif

namespace {

// On Windows, free() does not accept aligned memory.
#ifdef _WIN32
void* allocateAligned(std::size_t size, std::size_t alignment)
{
    return _aligned_malloc(size, alignment);
}
void freeAligned(void* memory)
{
    _aligned_free(memory);
}
#else
void* allocateAligned(std::size_t size, std::size_t alignment)
{
    return std::aligned_alloc(alignment, (size + alignment - 1) / alignment * alignment);
}
void freeAligned(void* memory)
{
    std::free(memory);
}
#endif

} // namespace

void* operator new(std::size_t size, const std::nothrow_t&) noexcept
{
    return nextAllocationFails() ? nullptr : std::malloc(size ? size : 1);
}
void* operator new(std::size_t size)
{
    void* memory = operator new(size, std::nothrow);
    if (!memory)
        throw std::bad_alloc();
    return memory;
}
void* operator new(std::size_t size, std::align_val_t alignment)
{
    void* memory = nextAllocationFails()
                       ? nullptr
                       : allocateAligned(size, static_cast<std::size_t>(alignment));
    if (!memory)
        throw std::bad_alloc();
    return memory;
}
// A sanitizer's own operators would bypass these.
void* operator new[](std::size_t size, const std::nothrow_t&) noexcept
{
    return operator new(size, std::nothrow);
}
void* operator new[](std::size_t size)
{
    return operator new(size);
}
// Not inlined: otherwise compilers warn that free does not match new.
[[gnu::noinline]] void operator delete(void* memory) noexcept
{
    std::free(memory);
}
[[gnu::noinline]] void operator delete(void* memory, std::size_t) noexcept
{
    std::free(memory);
}
[[gnu::noinline]] void operator delete(void* memory, std::align_val_t) noexcept
{
    freeAligned(memory);
}
[[gnu::noinline]] void operator delete(void* memory, std::size_t, std::align_val_t) noexcept
{
    freeAligned(memory);
}
[[gnu::noinline]] void operator delete[](void* memory) noexcept
{
    std::free(memory);
}
[[gnu::noinline]] void operator delete[](void* memory, std::size_t) noexcept
{
    std::free(memory);
}
