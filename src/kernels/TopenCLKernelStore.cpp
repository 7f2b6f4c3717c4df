#include "kernels/TopenCLKernelStore.h"

#include "diagnostics/CLInternalWarning.h"
#include "diagnostics/CLStatusReport.h"
#include "kernels/KernelStoreIndex.h"
#include "loader/OpenCLLoader.h"
#include "runtime/TopenCLInfo.h"

#include <algorithm>
#include <memory>
#include <new>

namespace {

constexpr std::size_t kInitialBuckets = 8;
constexpr float kMaximumLoadFactor = 1.0F;

} // namespace

std::size_t TopenCLKernelStore::ProgramKeyHash::operator()(const ProgramKey& key) const
{
    return key.first.hash() + key.second.hash();
}

TopenCLKernelStore::TopenCLKernelStore()
    : fPrograms(kInitialBuckets), fIndex(std::make_unique<Index>())
{
    fPrograms.max_load_factor(kMaximumLoadFactor);
}

TopenCLKernelStore::~TopenCLKernelStore()
{
    const tbb::spin_mutex::scoped_lock lock(fLock);
    fPrograms.clear();
}

void TopenCLKernelStore::initialize(cl_context context, cl_device_id device,
                                    OpenCLProvider provider)
{
    if (!context)
        return;
    fContext = context;
    fDevice = device;
    fProvider = provider;
}

AutoCLObject<cl_kernel> TopenCLKernelStore::getKernel(const char* fileName, const char* buildFlags,
                                                      const char* kernelName,
                                                      const TstringArray* includeDirs)
{
    const tbb::spin_mutex::scoped_lock lock(fLock);
    const Index::Request request(fileName, buildFlags, includeDirs);
    ProgramInfo* program = fIndex->find(request);
    if (!program)
        program = fIndex->remember(request, getProgram(fileName, buildFlags, includeDirs));
    return program ? createKernel(*program, kernelName) : AutoCLObject<cl_kernel>();
}

AutoCLObject<cl_kernel> TopenCLKernelStore::getKernelFromString(const char* source,
                                                                const char* programName,
                                                                const char* buildFlags,
                                                                const char* kernelName,
                                                                const TstringArray* includeDirs)
{
    const tbb::spin_mutex::scoped_lock lock(fLock);
    const Index::Request request(programName, buildFlags, includeDirs);
    ProgramInfo* program = fIndex->find(request);
    if (!program)
        program = fIndex->remember(
            request, getProgramFromString(source, programName, buildFlags, includeDirs));
    return program ? createKernel(*program, kernelName) : AutoCLObject<cl_kernel>();
}

// Creates a kernel with two references: the result's, and that of the program's list.
AutoCLObject<cl_kernel> TopenCLKernelStore::createKernel(ProgramInfo& program,
                                                         const char* kernelName)
{
    // Memory for both lists first, so that running out of it loses no kernel.
    reserveForOne(program.fKernels);
    fIndex->reserveForKernel();
    AutoCLObject<cl_kernel> kernel;
    cl_int status = CL_SUCCESS;
    kernel.adopt(ocl.clCreateKernel(program.fProgram.get(), kernelName, &status));
    reportFailure(status);
    if (kernel.get()) {
        program.fKernels.push_back(kernel);
        fIndex->add(kernel.get(), program);
    }
    return kernel;
}

bool TopenCLKernelStore::freeKernel(const AutoCLObject<cl_kernel>& kernel)
{
    if (!kernel.get())
        return true;
    const tbb::spin_mutex::scoped_lock lock(fLock);
    ProgramInfo* program = fIndex->take(kernel.get());
    if (!program)
        return false;
    // One element: a handle that the runtime returned twice is listed twice.
    auto& kernels = program->fKernels;
    kernels.erase(std::ranges::find(kernels, kernel.get(), &AutoCLObject<cl_kernel>::get));
    if (kernels.empty()) {
        fIndex->forget(*program);
        std::erase_if(fPrograms, [&](const auto& entry) { return &entry.second == program; });
    }
    return true;
}

TopenCLKernelStore::ProgramInfo* TopenCLKernelStore::getProgram(const char* fileName,
                                                                const char* buildFlags,
                                                                const TstringArray* includeDirs)
{
    ProgramKey key(fileName, expandBuildFlags(buildFlags, includeDirs));
    if (const auto entry = fPrograms.find(key); entry != fPrograms.end())
        return &entry->second;

    Tstring source;
    if (!TopenCLInfo::oclLoadProgSource(source, fileName, ""))
        return nullptr;
    return cacheProgram(std::move(key), source.asChar());
}

TopenCLKernelStore::ProgramInfo*
TopenCLKernelStore::getProgramFromString(const char* source, const char* programName,
                                         const char* buildFlags, const TstringArray* includeDirs)
{
    ProgramKey key(programName, expandBuildFlags(buildFlags, includeDirs));
    if (const auto entry = fPrograms.find(key); entry != fPrograms.end())
        return &entry->second;
    return cacheProgram(std::move(key), source);
}

// Builds the program of a key that is not cached. Returns null, and caches nothing, on failure.
TopenCLKernelStore::ProgramInfo* TopenCLKernelStore::cacheProgram(ProgramKey&& key,
                                                                  const char* source)
{
    AutoCLObject<cl_program> program;
    program.adopt(getProgramFromString(source, key.second.asChar()));
    if (!program.get())
        return nullptr;
    ProgramInfo& info = fPrograms[std::move(key)];
    info.fProgram = std::move(program);
    return &info;
}

// Returns a built program, whose one reference the caller owns, or null on failure.
cl_program TopenCLKernelStore::getProgramFromString(const char* source, const char* options)
{
    Tstring buildOptions(options);
    if (fProvider == kNVIDIAProvider)
        buildOptions += " -cl-nv-verbose";

    cl_int status = CL_SUCCESS;
    cl_program program = ocl.clCreateProgramWithSource(fContext, 1, &source, nullptr, &status);
    reportFailure(status);
    if (!program)
        return nullptr;

    reportFailure(
        ocl.clBuildProgram(program, 1, &fDevice, buildOptions.asChar(), nullptr, nullptr));
    cl_build_status buildStatus = CL_BUILD_ERROR;
    const bool known = checkStatus(ocl.clGetProgramBuildInfo(
        program, fDevice, CL_PROGRAM_BUILD_STATUS, sizeof buildStatus, &buildStatus, nullptr));
    if (known && buildStatus == CL_BUILD_SUCCESS)
        return program;

    reportBuildLog(program);
    ocl.clReleaseProgram(program); // the only reference; a failure cannot be handled
    return nullptr;
}

// Passes the build log to the warning sink unless it is empty.
void TopenCLKernelStore::reportBuildLog(cl_program program)
{
    std::size_t size = 0;
    if (!checkStatus(
            ocl.clGetProgramBuildInfo(program, fDevice, CL_PROGRAM_BUILD_LOG, 0, nullptr, &size)))
        return;
    if (size == 0)
        return;
    // Without memory for the log there is none: the caller must still release the program.
    const std::unique_ptr<char[]> log(new (std::nothrow) char[size + 1]());
    if (log &&
        checkStatus(ocl.clGetProgramBuildInfo(program, fDevice, CL_PROGRAM_BUILD_LOG, size,
                                              log.get(), nullptr)) &&
        log[0] != '\0')
        CLInternalWarning("%s", log.get());
}
