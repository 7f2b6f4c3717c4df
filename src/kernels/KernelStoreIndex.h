// Fast look-up in the kernel store's cache. Internal.
#pragma once

#include "diagnostics/ReserveForOne.h"
#include "host/TstringArray.h"
#include "kernels/TopenCLKernelStore.h"

#include <cstddef>
#include <string_view>
#include <unordered_map>
#include <vector>

// An index that finds a program by the arguments of a request, without building its option string,
// and by a kernel created from it, without a search through all programs.
//
// The store's own map and lists hold the same entries. A program that is not found by a request may
// still be in the store, under other arguments that give the same key. Guarded by the store's lock.
// Throws std::bad_alloc when memory runs out, and is then unchanged.
class TopenCLKernelStore::Index {
public:
    // The arguments of a request that determine a program's key. Borrowed.
    struct Request {
        Request(const char* programName, const char* buildFlags, const TstringArray* dirs);
        std::size_t hash() const;

        std::string_view name;
        std::string_view flags; // empty for the default options
        bool defaultFlags;
        const TstringArray* includeDirs; // may be null
        bool doublePrecision;
    };

    // Returns the program of an equal request since the program was built, or null.
    ProgramInfo* find(const Request& request) const;
    // Makes find return `program` for `request`. Returns `program`; null is not stored.
    ProgramInfo* remember(const Request& request, ProgramInfo* program);

    // Makes the next call of add allocate nothing.
    void reserveForKernel() { reserveForOne(fKernels); }
    void add(cl_kernel kernel, ProgramInfo& program);
    // Removes `kernel` and returns its program, or null if the kernel is not in the index.
    [[nodiscard]] ProgramInfo* take(cl_kernel kernel);

    // Removes every entry of a program that is about to be destroyed.
    void forget(const ProgramInfo& program);

private:
    // A request that owns its texts.
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
    struct KernelInUse {
        cl_kernel kernel;
        ProgramInfo* program;
    };

    std::unordered_multimap<std::size_t, KnownRequest> fRequests; // by hash
    std::vector<KernelInUse> fKernels;                            // the latest near the end
};
