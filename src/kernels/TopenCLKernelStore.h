// Kernels, from programs that are built once.
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

// Builds each program once per name and option string, keeps it while kernels made from it are
// outstanding, and hands out a new kernel object for every request, so that no two callers share
// the arguments of one.
//
// Programs from files (named by their path) and from source texts share one cache; the text itself
// is not part of the key. Any number of threads may call; they take turns, and a turn that misses
// the cache lasts for the reading of a file and a whole build. Failing OpenCL calls are reported as
// warnings and give an empty result; a failed build also passes its log to the warning sink. A file
// that cannot be read and a program that does not build are not cached: the next request tries
// again. A program that builds stays cached even if it has no kernel of the requested name.
class VYRA_OPENCL_API TopenCLKernelStore {
public:
    TopenCLKernelStore();
    // Drops the store's references. Kernels that callers still hold stay usable.
    ~TopenCLKernelStore();
    TopenCLKernelStore(const TopenCLKernelStore&) = delete;
    TopenCLKernelStore& operator=(const TopenCLKernelStore&) = delete;

    // Called once, before anybody else uses the store. The handles are borrowed. A null `context`
    // changes nothing.
    void initialize(cl_context context, cl_device_id device, OpenCLProvider provider);

    // A new kernel `kernelName` of the program in the file `fileName`, taken exactly as given. Null
    // `buildFlags` stand for the default options (an empty text does not); `includeDirs` may be
    // null. The caller owns the result's reference and gives the kernel back with freeKernel. Wraps
    // clCreateKernel and, for a program that is not cached, clCreateProgramWithSource and
    // clBuildProgram.
    AutoCLObject<cl_kernel> getKernel(const char* fileName, const char* buildFlags,
                                      const char* kernelName, const TstringArray* includeDirs);

    // The same for the NUL-terminated program text `source`, cached under `programName`.
    AutoCLObject<cl_kernel> getKernelFromString(const char* source, const char* programName,
                                                const char* buildFlags, const char* kernelName,
                                                const TstringArray* includeDirs);

    // Gives back a kernel of this store; its program goes with the last one. True when the kernel
    // was found, and for an empty holder. The caller's own reference is not touched.
    bool freeKernel(const AutoCLObject<cl_kernel>& kernel);

private:
    struct ProgramInfo {
        AutoCLObject<cl_program> fProgram;
        std::vector<AutoCLObject<cl_kernel>> fKernels; // handed out and not yet given back
    };

    class Index; // short cuts to what fPrograms holds

    // The program's name and its option string, without the vendor's own flag.
    using ProgramKey = std::pair<Tstring, Tstring>;
    struct ProgramKeyHash {
        std::size_t operator()(const ProgramKey& key) const;
    };

    ProgramInfo* getProgram(const char* fileName, const char* buildFlags,
                            const TstringArray* includeDirs);
    ProgramInfo* getProgramFromString(const char* source, const char* programName,
                                      const char* buildFlags, const TstringArray* includeDirs);
    cl_program getProgramFromString(const char* source, const char* options);
    ProgramInfo* cacheProgram(ProgramKey&& key, const char* source);
    AutoCLObject<cl_kernel> createKernel(ProgramInfo& program, const char* kernelName);
    void reportBuildLog(cl_program program);
    Tstring expandBuildFlags(const char* flags, const TstringArray* includeDirs);

    cl_context fContext = nullptr;
    cl_device_id fDevice = nullptr;
    OpenCLProvider fProvider = kUnknownProvider;
    tbb::spin_mutex fLock; // guards fPrograms, all in it, and the index
    std::unordered_map<ProgramKey, ProgramInfo, ProgramKeyHash> fPrograms;
    std::unique_ptr<Index> fIndex;
};
