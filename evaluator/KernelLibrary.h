// The kernels of all deformers, from files that may be edited while the program runs. Internal.
#pragma once

#include "evaluator/Deformer.h"
#include "evaluator/OpenCLFunctions.h"
#include "evaluator/Status.h"
#include "evaluator/StoreKernel.h"

#include "host/TstringArray.h"

#include <atomic>
#include <cstddef>
#include <map>
#include <mutex>
#include <optional>
#include <string>
#include <tuple>
#include <vector>

#include <CL/cl.h>

namespace vyra {

// A kernel for one user, with what is known about it.
struct LibraryKernel {
    StoreKernel kernel; // empty on failure
    cl_uint argumentCount = 0;
    std::size_t workGroupSize = 0; // work-items
    unsigned generation = 0;       // KernelLibrary::generation() when it was created
    Status status;
};

// Finds kernel files, and creates kernels with the kernel store. Each program stays built until the
// library is destroyed. A file that was replaced stands for its new text. Safe from any thread.
class KernelLibrary {
public:
    // Searches `directories` in their order. Needs the runtime object to be valid.
    KernelLibrary(const OpenCLFunctions& cl, const std::vector<std::string>& directories);
    KernelLibrary(const KernelLibrary&) = delete;
    KernelLibrary& operator=(const KernelLibrary&) = delete;

    // A new kernel object. A failure names the file, and carries the build log if there is one.
    LibraryKernel create(const KernelSource& source);
    // Reports how many arguments a deformer passes to the kernel, which a text that replaces the
    // file is measured by.
    void noteArguments(const KernelSource& source, cl_uint count);

    // Uses this text for `file` from now on, for kernels created afterwards. Fails, and changes
    // nothing, unless every kernel that was created from the file can be created from the text with
    // the arguments that its deformer passes. Ignores a file that nobody asked for.
    Status replaceFile(const std::string& file, const std::string& text);

    // Changes whenever a file is replaced: kernels of an older generation are to be created again.
    unsigned generation() const { return fGeneration; }

    std::size_t programsBuilt() const;
    std::size_t kernelsCreated() const;

private:
    using Key = std::tuple<std::string, std::string, std::string>; // file, function, options
    struct Entry {
        StoreKernel keeper;      // keeps the program built; empty if no kernel was created yet
        cl_uint passedCount = 0; // of arguments, by the deformer; 0 while it is unknown
    };
    // A source that is not read from a file.
    struct ProgramText {
        std::string programName; // in the kernel store
        std::string text;
    };

    LibraryKernel build(const Key& key, const ProgramText* program);
    const ProgramText* textOf(const KernelSource& source);
    bool isProgramKept(const Key& key) const;
    Status examine(const Key& key, LibraryKernel& created) const;
    std::optional<std::string> findFile(const std::string& file) const;
    std::string describeMissingFile(const std::string& file) const;
    Status failure(const Key& key, const std::string& path, const std::string& warnings) const;

    const OpenCLFunctions& fCL;
    std::vector<std::string> fDirectories;
    TstringArray fIncludeDirectories;
    mutable std::mutex fMutex; // guards all that follows; the generation is read without it
    std::map<Key, Entry> fEntries;
    std::map<std::string, ProgramText>
        fTexts; // by file: those that replaced one, or are in no file
    std::atomic<unsigned> fGeneration = 0;
    unsigned fReplacementCount = 0;
    std::size_t fProgramsBuilt = 0;
    std::size_t fKernelsCreated = 0;
};

} // namespace vyra
