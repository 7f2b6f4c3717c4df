#include "frames/Allocations.h"

#include <algorithm>
#include <atomic>
#include <cstdint>
#include <cstdlib>
#include <new>
#include <string_view>

#include <link.h>

namespace {

// The addresses of a module's code, end excluded.
struct Module {
    std::uintptr_t begin = 0;
    std::uintptr_t end = 0;
    std::atomic<std::size_t> allocations{0};

    bool contains(std::uintptr_t address) const { return address >= begin && address < end; }
};

Module theLibrary;
Module theProgram;
std::atomic<std::size_t> otherAllocations{0};
std::atomic<bool> counting{false};

void locate(Module& module, const dl_phdr_info& info)
{
    module.begin = UINTPTR_MAX;
    for (int i = 0; i < info.dlpi_phnum; ++i) {
        const ElfW(Phdr)& segment = info.dlpi_phdr[i];
        if (segment.p_type != PT_LOAD)
            continue;
        const std::uintptr_t begin = info.dlpi_addr + segment.p_vaddr;
        module.begin = std::min(module.begin, begin);
        module.end = std::max(module.end, begin + segment.p_memsz);
    }
}

int locateOne(dl_phdr_info* info, std::size_t, void*)
{
    const std::string_view name = info->dlpi_name;
    if (name.empty() && theProgram.end == 0) // the program comes first and has no name
        locate(theProgram, *info);
    else if (name.find("libvyra-opencl.so") != std::string_view::npos)
        locate(theLibrary, *info);
    return 0;
}

void countFor(const void* caller)
{
    if (!counting.load(std::memory_order_relaxed))
        return;
    const auto address = reinterpret_cast<std::uintptr_t>(caller);
    if (theLibrary.contains(address))
        ++theLibrary.allocations;
    else if (theProgram.contains(address))
        ++theProgram.allocations;
    else
        ++otherAllocations;
}

} // namespace

void startCounting()
{
    dl_iterate_phdr(locateOne, nullptr);
    counting = true;
}

Allocations allocationsSoFar()
{
    return {theLibrary.allocations, theProgram.allocations, otherAllocations};
}

void* operator new(std::size_t size)
{
    countFor(__builtin_return_address(0));
    if (void* memory = std::malloc(size ? size : 1))
        return memory;
    throw std::bad_alloc();
}

void operator delete(void* memory) noexcept
{
    std::free(memory);
}

void operator delete(void* memory, std::size_t) noexcept
{
    std::free(memory);
}
