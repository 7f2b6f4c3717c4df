// Short cuts into the kernel store's cache. Internal.
#pragma once

#include "host/TstringArray.h"
#include "kernels/TopenCLKernelStore.h"

#include <cstddef>
#include <string_view>
#include <unordered_map>
#include <vector>

// So that one more element can be appended without memory.
template <typename Element>
void makeRoomForOne(std::vector<Element>& list)
{
    if (list.size() == list.capacity())
        list.reserve(2 * list.size() + 1);
}

// Finds a program by the words in which it was asked for, without its option string being put
// together, and by a kernel that was made from it, without a walk through all programs.
//
// Everything in here stands in the store's own map and lists as well; a program that is not found
// by its request may still be there, asked for in other words. Guarded by the store's lock. Running
// out of memory raises std::bad_alloc and changes nothing.
class TopenCLKernelStore::Index {
public:
    // What a program's key depends on, as it was asked for. Borrows its arguments.
    struct Request {
        Request(const char* programName, const char* buildFlags, const TstringArray* dirs);
        std::size_t hash() const;

        std::string_view name;
        std::string_view flags; // empty for the default options
        bool defaultFlags;
        const TstringArray* includeDirs; // may be null
        bool doublePrecision;
    };

    // Null when nobody asked in these words since the program was built.
    ProgramInfo* find(const Request& request) const;
    // Has `program` found by `request`. Returns `program`; null is not remembered.
    ProgramInfo* remember(const Request& request, ProgramInfo* program);

    // So that the next kernel can be added without memory.
    void makeRoomForKernel() { makeRoomForOne(fKernels); }
    void add(cl_kernel kernel, ProgramInfo& program);
    // The program of `kernel`, which is known no longer afterwards; null when it is not known.
    ProgramInfo* take(cl_kernel kernel);

    // Removes every entry of a program that is about to be dropped.
    void forget(const ProgramInfo& program);

private:
    // A request with texts of its own.
    struct KnownRequest {
        KnownRequest(const Request& request, ProgramInfo* itsProgram);
        bool operator==(const Request& request) const;

        Tstring name;
        Tstring flags;
        bool defaultFlags;
        TstringArray includeDirs;
        bool doublePrecision;
        ProgramInfo* program;
    };
    struct HandedOut {
        cl_kernel kernel;
        ProgramInfo* program;
    };

    std::unordered_multimap<std::size_t, KnownRequest> fRequests; // by hash
    std::vector<HandedOut> fKernels;                              // the latest near the end
};
