#include "ReplacedOperators.h"

#include <cstdlib>
#include <new>

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
[[gnu::noinline]] void operator delete[](void* memory) noexcept
{
    std::free(memory);
}
[[gnu::noinline]] void operator delete[](void* memory, std::size_t) noexcept
{
    std::free(memory);
}

#ifndef _WIN32 // where free() does not accept aligned memory, and where none is tested
void* operator new(std::size_t size, std::align_val_t alignment)
{
    const auto unit = static_cast<std::size_t>(alignment);
    void* memory =
        nextAllocationFails() ? nullptr : std::aligned_alloc(unit, (size + unit - 1) / unit * unit);
    if (!memory)
        throw std::bad_alloc();
    return memory;
}
[[gnu::noinline]] void operator delete(void* memory, std::align_val_t) noexcept
{
    std::free(memory);
}
[[gnu::noinline]] void operator delete(void* memory, std::size_t, std::align_val_t) noexcept
{
    std::free(memory);
}
#endif
