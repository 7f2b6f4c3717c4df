#include "evaluator/KernelLibrary.h"

#include "evaluator/WarningCapture.h"

#include "diagnostics/CLErrorCodes.h"
#include "kernels/TopenCLKernelStore.h"
#include "runtime/TopenCLInfo.h"

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <utility>

namespace vyra {
namespace {

// Without -cl-fast-relaxed-math: the bounds of the deformers' errors hold on every device.
constexpr const char* kBuildOptions = "-cl-no-signed-zeros -Werror";

std::string buildOptions(const std::string& added)
{
    return added.empty() ? std::string(kBuildOptions) : kBuildOptions + (" " + added);
}

// Why the file cannot be a kernel file; empty if it has contents that can be read.
std::string unreadable(const std::string& path)
{
    errno = 0;
    std::ifstream file(path, std::ios::binary);
    if (!file)
        return std::string("cannot be read (") + std::strerror(errno) + ")";
    return file.peek() == std::ifstream::traits_type::eof() ? "is empty" : std::string();
}

} // namespace

KernelLibrary::KernelLibrary(const OpenCLFunctions& cl, const std::vector<std::string>& directories)
    : fCL(cl), fDirectories(directories)
{
    for (const std::string& directory : fDirectories)
        fIncludeDirectories.append(Tstring(directory.c_str()));
}

KernelLibrary::~KernelLibrary()
{
    for (const auto& [key, entry] : fEntries)
        giveBack(entry.keeper);
}

void KernelLibrary::giveBack(const AutoCLObject<cl_kernel>& kernel)
{
    TopenCLInfo::theOne().kernelStore().freeKernel(kernel);
}

LibraryKernel KernelLibrary::create(const KernelSource& source)
{
    const Key key(source.file, source.function, source.options);
    const std::scoped_lock lock(fMutex);
    auto text = fTexts.find(std::get<0>(key));
    if (text == fTexts.end() && !source.text.empty())
        text = fTexts
                   .emplace(source.file,
                            ProgramText{std::string(source.file), std::string(source.text)})
                   .first;
    const ProgramText* program = text == fTexts.end() ? nullptr : &text->second;
    LibraryKernel kernel = build(key, program);
    if (!kernel.status.ok())
        return kernel;
    fKernelsCreated += 1;

    Entry& entry = fEntries[key];
    if (!entry.keeper.get()) {
        LibraryKernel keeper = build(key, program);
        entry = {std::move(keeper.kernel), kernel.argumentCount, kernel.workGroupSize};
        fProgramsBuilt += 1;
    }
    return kernel;
}

// One kernel of a program text, or of the file if it is null. The caller holds the lock.
LibraryKernel KernelLibrary::build(const Key& key, const ProgramText* program)
{
    const auto& [file, function, options] = key;
    LibraryKernel result;
    result.generation = fGeneration;
    const std::optional<std::string> path = findFile(file);
    if (!program && !path) {
        result.status = Status(describeMissingFile(file));
        return result;
    }
    TopenCLInfo& info = TopenCLInfo::theOne();
    TopenCLKernelStore& store = info.kernelStore();
    const std::string flags = buildOptions(options);
    const WarningCapture warnings;
    result.kernel =
        program
            ? store.getKernelFromString(program->text.c_str(), program->programName.c_str(),
                                        flags.c_str(), function.c_str(), &fIncludeDirectories)
            : store.getKernel(path->c_str(), flags.c_str(), function.c_str(), &fIncludeDirectories);
    if (!result.kernel.get()) {
        result.status = failure(key, program ? std::string() : *path, warnings.text());
        return result;
    }
    cl_int status =
        fCL.clGetKernelInfo(result.kernel.get(), CL_KERNEL_NUM_ARGS, sizeof(result.argumentCount),
                            &result.argumentCount, nullptr);
    std::size_t roundedCount = 0;
    if (status == CL_SUCCESS)
        status = info.getWorkGroupSizes(result.kernel.get(), 1, roundedCount, result.workGroupSize);
    if (status != CL_SUCCESS) {
        giveBack(result.kernel);
        result.kernel.reset();
        result.status =
            Status("the kernel '" + function + "' of " + file + " cannot be examined (" +
                       CLErrorCodeStr(status) + "); check the OpenCL driver",
                   status);
    }
    return result;
}

Status KernelLibrary::failure(const Key& key, const std::string& path,
                              const std::string& warnings) const
{
    const auto& [file, function, options] = key;
    if (warnings.find("CL_INVALID_KERNEL_NAME") != std::string::npos)
        return Status("the kernel file " + file + " has no kernel '" + function +
                          "'; check the names",
                      CL_INVALID_KERNEL_NAME);
    const std::string reason = path.empty() ? std::string() : unreadable(path);
    if (!reason.empty())
        return Status("the kernel file '" + path + "' " + reason);
    return Status("the kernel file '" + (path.empty() ? file : path) + "' does not compile:\n" +
                      (warnings.empty() ? "there is no build log\n" : warnings),
                  CL_BUILD_PROGRAM_FAILURE);
}

std::optional<std::string> KernelLibrary::findFile(const std::string& file) const
{
    namespace fs = std::filesystem;
    std::error_code error;
    if (fs::path(file).is_absolute())
        return fs::exists(file, error) ? std::optional(file) : std::nullopt;
    for (const std::string& directory : fDirectories) {
        const fs::path path = fs::path(directory) / file;
        if (fs::exists(path, error))
            return path.string();
    }
    return std::nullopt;
}

std::string KernelLibrary::describeMissingFile(const std::string& file) const
{
    if (std::filesystem::path(file).is_absolute())
        return "there is no kernel file '" + file + "'; check the path";
    std::string searched;
    for (const std::string& directory : fDirectories)
        searched += (searched.empty() ? "'" : ", '") + directory + "'";
    return "there is no kernel file '" + file + "' in " + searched +
           "; put it there, or add its directory to EvaluatorSettings::kernelDirectories";
}

Status KernelLibrary::replaceFile(const std::string& file, const std::string& text)
{
    const std::scoped_lock lock(fMutex);
    const ProgramText next{file + ", change " + std::to_string(++fReplacementCount), text};
    std::map<Key, Entry> replaced;
    const auto giveBackAll = [&replaced] {
        for (const auto& [key, entry] : replaced)
            giveBack(entry.keeper);
    };
    for (const auto& [key, entry] : fEntries) {
        if (std::get<0>(key) != file)
            continue;
        LibraryKernel kernel = build(key, &next);
        if (kernel.status.ok() && kernel.argumentCount != entry.argumentCount)
            kernel.status = Status("the kernel '" + std::get<1>(key) + "' of " + file + " takes " +
                                   std::to_string(kernel.argumentCount) +
                                   " arguments, and its deformer passes " +
                                   std::to_string(entry.argumentCount));
        if (kernel.kernel.get())
            replaced[key] = {std::move(kernel.kernel), kernel.argumentCount, kernel.workGroupSize};
        if (!kernel.status.ok()) {
            giveBackAll();
            return kernel.status;
        }
    }
    if (replaced.empty())
        return {};
    for (auto& [key, entry] : replaced) {
        giveBack(fEntries[key].keeper);
        fEntries[key] = std::move(entry);
        fProgramsBuilt += 1;
    }
    fTexts[file] = next;
    fGeneration += 1;
    return {};
}

std::size_t KernelLibrary::programsBuilt() const
{
    const std::scoped_lock lock(fMutex);
    return fProgramsBuilt;
}

std::size_t KernelLibrary::kernelsCreated() const
{
    const std::scoped_lock lock(fMutex);
    return fKernelsCreated;
}

} // namespace vyra
