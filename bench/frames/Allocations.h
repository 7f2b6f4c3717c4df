// Counts of allocations with `new` in the whole process: this program replaces the global operator.
#pragma once

#include <cstddef>

// Calls of operator new so far.
struct Allocations {
    std::size_t library = 0; // from the library's own code
    std::size_t program = 0; // from this program, the viewer's parts and inlined code included
    std::size_t others = 0;  // OpenCL, oneTBB, Qt, OpenGL

    Allocations operator-(const Allocations& earlier) const
    {
        return {library - earlier.library, program - earlier.program, others - earlier.others};
    }
    Allocations& operator+=(const Allocations& more)
    {
        library += more.library;
        program += more.program;
        others += more.others;
        return *this;
    }
};

// Returns the allocations of all threads since startCounting().
Allocations allocationsSoFar();
// Locates the code of the library and of the program, and starts counting.
void startCounting();
