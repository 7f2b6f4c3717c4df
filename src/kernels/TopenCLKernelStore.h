// A cache of programs that hands out kernels.
#pragma once

#include "VyraOpenCLExport.h"
#include "diagnostics/AutoCLObject.h"
#include "host/Tstring.h"
#include "runtime/OpenCLProvider.h"

#include <cstddef>
#include <memory>
#include <unordered_map>
#include <utility>
#include <vector>

#include <CL/cl.h>
#include <tbb/spin_mutex.h>

class TstringArray;

// A cache that builds each program once per name and option string and keeps it while kernels
// created from it are in use. Every request returns a new kernel object, so that no two callers
// share its arguments.
//
// Programs from files (named by their path) and from source texts share one cache; the text itself
// is not part of the key. Safe from any thread; calls are serialised, and a call that misses the
// cache reads a file and builds a program. Failing OpenCL calls are reported as warnings and return
// an empty holder; a failed build also passes its log to the warning sink. A file that cannot be
// read and a program that does not build are not cached: the next request tries again. A program
// that builds stays cached even if it has no kernel of the requested name.
class VYRA_OPENCL_API TopenCLKernelStore {
public:
    TopenCLKernelStore();
    // Releases the store's references. Kernels that callers still hold stay usable.
    ~TopenCLKernelStore();
    TopenCLKernelStore(const TopenCLKernelStore&) = delete;
    TopenCLKernelStore& operator=(const TopenCLKernelStore&) = delete;

    // Sets the context and device to build for. Called once, before any other function. The handles
    // are borrowed. A null `context` changes nothing.
    void initialize(cl_context context, cl_device_id device, OpenCLProvider provider);

    // Returns a new kernel `kernelName` of the program in the file `fileName`, a path that is used
    // unchanged. Null `buildFlags` select the default options (an empty text does not);
    // `includeDirs` may be null. The caller owns the result's reference and releases the kernel
    // with freeKernel. Wraps clCreateKernel and, for a program that is not cached,
    // clCreateProgramWithSource and clBuildProgram.
    [[nodiscard]] AutoCLObject<cl_kernel> getKernel(const char* fileName, const char* buildFlags,
                                                    const char* kernelName,
                                                    const TstringArray* includeDirs);

    // As getKernel, for the NUL-terminated program text `source`, cached under `programName`.
    [[nodiscard]] AutoCLObject<cl_kernel>
    getKernelFromString(const char* source, const char* programName, const char* buildFlags,
                        const char* kernelName, const TstringArray* includeDirs);

    // Removes a kernel from the store, and its program with the program's last kernel. Returns true
    // if the kernel was found, and for an empty holder. The caller's own reference is unchanged.
    bool freeKernel(const AutoCLObject<cl_kernel>& kernel);

private:
    struct ProgramInfo {
        AutoCLObject<cl_program> fProgram;
        std::vector<AutoCLObject<cl_kernel>> fKernels; // returned by getKernel and not yet freed
    };

    class Index; // fast look-up of the contents of fPrograms

    // The program's name and its option string, without the vendor's flag.
    using ProgramKey = std::pair<Tstring, Tstring>;
    struct ProgramKeyHash {
        std::size_t operator()(const ProgramKey& key) const;
    };

    [[nodiscard]] ProgramInfo* getProgram(const char* fileName, const char* buildFlags,
                                          const TstringArray* includeDirs);
    [[nodiscard]] ProgramInfo* getProgramFromString(const char* source, const char* programName,
                                                    const char* buildFlags,
                                                    const TstringArray* includeDirs);
    [[nodiscard]] cl_program getProgramFromString(const char* source, const char* options);
    [[nodiscard]] ProgramInfo* cacheProgram(ProgramKey&& key, const char* source);
    [[nodiscard]] AutoCLObject<cl_kernel> createKernel(ProgramInfo& program,
                                                       const char* kernelName);
    void reportBuildLog(cl_program program);
    Tstring expandBuildFlags(const char* flags, const TstringArray* includeDirs);

    cl_context fContext = nullptr;
    cl_device_id fDevice = nullptr;
    OpenCLProvider fProvider = kUnknownProvider;
    tbb::spin_mutex fLock; // guards fPrograms, all in it, and the index
    std::unordered_map<ProgramKey, ProgramInfo, ProgramKeyHash> fPrograms;
    std::unique_ptr<Index> fIndex;
};
