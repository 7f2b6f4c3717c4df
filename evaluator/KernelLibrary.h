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

// A kernel object of one deformer pass, and its properties.
struct LibraryKernel {
    StoreKernel kernel; // empty on failure
    cl_uint argumentCount = 0;
    std::size_t workGroupSize = 0; // work-items
    unsigned generation = 0;       // KernelLibrary::generation() when it was created
    Status status;
};

// A source of kernels: finds kernel files, and creates kernels with the kernel store. Each program
// stays built until the library is destroyed. A replaced file reads as its new text. Safe from any
// thread.
class KernelLibrary {
public:
    // Searches `directories` in their order. Requires TopenCLInfo::isValid.
    KernelLibrary(const OpenCLFunctions& cl, const std::vector<std::string>& directories);
    KernelLibrary(const KernelLibrary&) = delete;
    KernelLibrary& operator=(const KernelLibrary&) = delete;

    // Creates a kernel object. The status of a failure names the file and has the build log, if
    // any.
    [[nodiscard]] LibraryKernel create(const KernelSource& source);
    // Records the number of arguments that a deformer passes to the kernel. A text that replaces
    // the file must have kernels with as many.
    void noteArguments(const KernelSource& source, cl_uint count);

    // Uses this text for `file` from now on, for kernels created afterwards. Fails, and changes
    // nothing, unless every kernel that was created from the file can be created from the text with
    // the arguments that its deformer passes. Ignores a file from which no kernel was requested.
    Status replaceFile(const std::string& file, const std::string& text);

    // Returns a number that changes whenever a file is replaced: kernels of an older generation are
    // out of date.
    unsigned generation() const noexcept { return fGeneration; }

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

    [[nodiscard]] LibraryKernel build(const Key& key, const ProgramText* program);
    const ProgramText* textOf(const KernelSource& source);
    bool isProgramKept(const Key& key) const;
    Status examine(const Key& key, LibraryKernel& created) const;
    [[nodiscard]] std::optional<std::string> findFile(const std::string& file) const;
    std::string describeMissingFile(const std::string& file) const;
    Status failure(const Key& key, const std::string& path, const std::string& warnings) const;

    const OpenCLFunctions& fCL;
    std::vector<std::string> fDirectories;
    TstringArray fIncludeDirectories;
    mutable std::mutex fMutex; // guards all that follows; the generation is read without it
    std::map<Key, Entry> fEntries;
    std::map<std::string, ProgramText> fTexts; // by file: texts that replaced a file or have none
    std::atomic<unsigned> fGeneration = 0;
    unsigned fReplacementCount = 0;
    std::size_t fProgramsBuilt = 0;
    std::size_t fKernelsCreated = 0;
};

} // namespace vyra
