// The kernels of all deformers, from files that may be edited while the program runs. Internal.
#pragma once

#include "evaluator/Deformer.h"
#include "evaluator/OpenCLFunctions.h"
#include "evaluator/Status.h"

#include "diagnostics/AutoCLObject.h"
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
    AutoCLObject<cl_kernel> kernel; // empty on failure; goes back with KernelLibrary::giveBack
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
    ~KernelLibrary();
    KernelLibrary(const KernelLibrary&) = delete;
    KernelLibrary& operator=(const KernelLibrary&) = delete;

    // A new kernel object. A failure names the file, and carries the build log if there is one.
    LibraryKernel create(const KernelSource& source);
    static void giveBack(const AutoCLObject<cl_kernel>& kernel);

    // Uses this text for `file` from now on, for kernels created afterwards. Fails, and changes
    // nothing, unless every kernel that was created from the file can be created from the text with
    // the same number of arguments. Ignores a file that was never used.
    Status replaceFile(const std::string& file, const std::string& text);

    // Changes whenever a file is replaced: kernels of an older generation are to be created again.
    unsigned generation() const { return fGeneration; }

    std::size_t programsBuilt() const;
    std::size_t kernelsCreated() const;

private:
    using Key = std::tuple<std::string, std::string, std::string>; // file, function, options
    struct Entry {
        AutoCLObject<cl_kernel> keeper; // keeps the program built
        cl_uint argumentCount = 0;
        std::size_t workGroupSize = 0;
    };
    // A source that is not read from a file.
    struct ProgramText {
        std::string programName; // in the kernel store
        std::string text;
    };

    LibraryKernel build(const Key& key, const ProgramText* program);
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
