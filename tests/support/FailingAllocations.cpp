// Selects the allocations that fail, and replaces the functions that oneTBB's containers call.
#include "FailingAllocations.h"

#include "ReplacedOperators.h"
#include "fake/FakeRuntime.h"

#include <new>

namespace scripted {

thread_local unsigned allocations = 0;
thread_local unsigned allocationsLeft = 0;
thread_local bool allLaterFail = false;
thread_local unsigned failures = 0;

} // namespace scripted

bool nextAllocationFails()
{
    using namespace scripted;
    if (InsideRuntime::here())
        return false;
    ++allocations;
    if (allocationsLeft == 0 || (allocationsLeft > 1 && --allocationsLeft > 0))
        return false;
    allocationsLeft = allLaterFail ? 1 : 0;
    ++failures;
    return true;
}

#ifndef _WIN32
// The functions that the allocators of TBB's containers call. A program's definition takes
// precedence over TBB's, except on Windows, where the tests of such containers are left out.
namespace tbb::detail::r1 {

constexpr std::align_val_t kCacheLine{128};

void* allocate_memory(std::size_t size)
{
    return operator new(size);
}
void deallocate_memory(void* memory)
{
    operator delete(memory);
}
void* cache_aligned_allocate(std::size_t size)
{
    return operator new(size, kCacheLine);
}
void cache_aligned_deallocate(void* memory)
{
    operator delete(memory, kCacheLine);
}

} // namespace tbb::detail::r1
#endif
