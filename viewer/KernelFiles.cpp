#include "viewer/KernelFiles.h"

#include "kernels/TopenCLKernelStore.h"
#include "runtime/TopenCLInfo.h"
#include "viewer/WarningCapture.h"

namespace viewer {
namespace {

// One program per file for all kernels: the store builds it once, since its kernels are kept.
AutoCLObject<cl_kernel> kernelOfFile(const char* file, const char* name)
{
    TopenCLInfo& info = TopenCLInfo::theOne();
    Tstring path = info.getAbsolutePathToResources();
    path += "/kernels/";
    path += file;
    return info.kernelStore().getKernel(path.asChar(), nullptr, name, nullptr);
}

void giveBack(const AutoCLObject<cl_kernel>& kernel)
{
    TopenCLInfo::theOne().kernelStore().freeKernel(kernel);
}

} // namespace

KernelFiles::~KernelFiles()
{
    for (const auto& [name, file] : fFiles)
        giveBack(file.keeper);
}

std::string KernelFiles::folder()
{
    return std::string(TopenCLInfo::theOne().getAbsolutePathToResources().asChar()) + "/kernels";
}

AutoCLObject<cl_kernel> KernelFiles::kernel(const std::string& file, const std::string& name)
{
    const auto [known, isNew] = fFiles.try_emplace(file, File{name, {}, {}, 0, {}});
    const NewKernel created = create(file, known->second);
    if (!created.kernel.get()) {
        fWarnings += created.warnings;
        return created.kernel;
    }
    known->second.arguments = argumentCount(created.kernel.get());
    fProgramsBuilt += isNew ? 1 : 0;
    fKernelsServed += 1;
    return created.kernel;
}

std::optional<std::string> KernelFiles::replace(const std::string& file, const std::string& source)
{
    const auto known = fFiles.find(file);
    if (known == fFiles.end())
        return std::nullopt;
    File next = known->second;
    next.programName = file + ", change " + std::to_string(++fReplacements);
    next.source = source;
    NewKernel created = create(file, next);
    if (auto text = error(file, next, created)) {
        giveBack(created.kernel);
        return text;
    }
    giveBack(next.keeper);
    next.keeper = std::move(created.kernel);
    known->second = std::move(next);
    fProgramsBuilt += 1;
    return std::nullopt;
}

KernelFiles::NewKernel KernelFiles::create(const std::string& name, const File& file)
{
    const WarningCapture warnings;
    NewKernel created;
    created.kernel = file.programName.empty()
                         ? kernelOfFile(name.c_str(), file.kernelName.c_str())
                         : TopenCLInfo::theOne().kernelStore().getKernelFromString(
                               file.source.c_str(), file.programName.c_str(), nullptr,
                               file.kernelName.c_str(), nullptr);
    created.warnings = warnings.text();
    return created;
}

std::optional<std::string> KernelFiles::error(const std::string& name, const File& file,
                                              const NewKernel& created) const
{
    if (!created.kernel.get())
        return name + ": the kernel '" + file.kernelName + "' cannot be built:\n" +
               created.warnings;
    const cl_uint arguments = argumentCount(created.kernel.get());
    if (arguments != file.arguments)
        return name + ": the kernel '" + file.kernelName + "' takes " + std::to_string(arguments) +
               " arguments, and the viewer passes " + std::to_string(file.arguments);
    return std::nullopt;
}

cl_uint KernelFiles::argumentCount(cl_kernel kernel) const
{
    cl_uint count = 0;
    fCL.clGetKernelInfo(kernel, CL_KERNEL_NUM_ARGS, sizeof(count), &count, nullptr);
    return count;
}

} // namespace viewer
