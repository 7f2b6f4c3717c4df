#include "evaluator/KernelLibrary.h"

#include "evaluator/KernelBuild.h"
#include "evaluator/WarningCapture.h"

#include "diagnostics/CLErrorCodes.h"
#include "kernels/TopenCLKernelStore.h"
#include "runtime/TopenCLInfo.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <set>
#include <utility>

namespace vyra {
namespace {

std::string buildOptions(const std::string& added)
{
    return added.empty() ? std::string(kKernelBuildOptions) : kKernelBuildOptions + (" " + added);
}

// Returns why the file cannot be used as a kernel file; empty if it can be read and is not empty.
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

LibraryKernel KernelLibrary::create(const KernelSource& source)
{
    const Key key(source.file, source.function, source.options);
    const std::scoped_lock lock(fMutex);
    const ProgramText* program = textOf(source);
    Entry& entry = fEntries[key]; // stays without a kernel if there is none: replaceFile tries it
    if (!entry.keeper.get()) {
        const bool isNewProgram = !isProgramKept(key);
        LibraryKernel keeper = build(key, program);
        if (!keeper.status.ok())
            return keeper;
        entry.keeper = std::move(keeper.kernel);
        fProgramsBuilt += isNewProgram ? 1 : 0;
    }
    LibraryKernel kernel = build(key, program);
    fKernelsCreated += kernel.status.ok() ? 1 : 0;
    return kernel;
}

// Returns the text used for the source's file, or null if the file is read. The caller holds the
// lock.
const KernelLibrary::ProgramText* KernelLibrary::textOf(const KernelSource& source)
{
    const std::string file(source.file);
    if (!source.text.empty())
        fTexts.try_emplace(file, ProgramText{file, std::string(source.text)});
    const auto text = fTexts.find(file);
    return text == fTexts.end() ? nullptr : &text->second;
}

// Returns whether a kernel of the same file and options keeps the program. The caller holds the
// lock.
bool KernelLibrary::isProgramKept(const Key& key) const
{
    return std::any_of(fEntries.begin(), fEntries.end(), [&key](const auto& other) {
        return other.second.keeper.get() && std::get<0>(other.first) == std::get<0>(key) &&
               std::get<2>(other.first) == std::get<2>(key);
    });
}

void KernelLibrary::noteArguments(const KernelSource& source, cl_uint count)
{
    const Key key(source.file, source.function, source.options);
    const std::scoped_lock lock(fMutex);
    fEntries[key].passedCount = count;
}

// Creates a kernel of a program text, or of the file if it is null. The caller holds the lock.
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
    TopenCLKernelStore& store = TopenCLInfo::theOne().kernelStore();
    const std::string flags = buildOptions(options);
    const WarningCapture warnings;
    AutoCLObject<cl_kernel> kernel =
        program
            ? store.getKernelFromString(program->text.c_str(), program->programName.c_str(),
                                        flags.c_str(), function.c_str(), &fIncludeDirectories)
            : store.getKernel(path->c_str(), flags.c_str(), function.c_str(), &fIncludeDirectories);
    result.kernel = StoreKernel(std::move(kernel));
    result.status = result.kernel.get()
                        ? examine(key, result)
                        : failure(key, program ? std::string() : *path, warnings.text());
    if (!result.status.ok())
        result.kernel = {};
    return result;
}

Status KernelLibrary::examine(const Key& key, LibraryKernel& created) const
{
    cl_int status =
        fCL.clGetKernelInfo(created.kernel.get(), CL_KERNEL_NUM_ARGS, sizeof(created.argumentCount),
                            &created.argumentCount, nullptr);
    std::size_t roundedCount = 0;
    if (status == CL_SUCCESS)
        status = TopenCLInfo::theOne().getWorkGroupSizes(created.kernel.get(), 1, roundedCount,
                                                         created.workGroupSize);
    if (status == CL_SUCCESS)
        return {};
    return Status("the kernel '" + std::get<1>(key) + "' of " + std::get<0>(key) +
                      " cannot be examined (" + CLErrorCodeStr(status) +
                      "); check the OpenCL driver",
                  status);
}

Status KernelLibrary::failure(const Key& key, const std::string& path,
                              const std::string& warnings) const
{
    const auto& [file, function, options] = key;
    const auto reported = [&warnings](const char* status) {
        return warnings.find(std::string("OpenCL error: ") + status) != std::string::npos;
    };
    const bool compiles = !reported("CL_BUILD_PROGRAM_FAILURE");
    if (compiles && reported("CL_INVALID_KERNEL_NAME"))
        return Status("the kernel file " + file + " has no kernel '" + function +
                          "'; check the names",
                      CL_INVALID_KERNEL_NAME);
    const std::string reason = path.empty() ? std::string() : unreadable(path);
    if (!reason.empty())
        return Status("the kernel file '" + path + "' " + reason);
    return Status("the kernel file '" + (path.empty() ? file : path) +
                      (compiles ? "' cannot be built:\n" : "' does not compile:\n") +
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
    ProgramText next{file + ", change " + std::to_string(++fReplacementCount), text};
    std::map<Key, StoreKernel> replaced;
    std::set<std::string> programs; // by their options
    Status failed;                  // of kernels that the former text lacks, too
    for (const auto& [key, entry] : fEntries) {
        if (std::get<0>(key) != file)
            continue;
        LibraryKernel kernel = build(key, &next);
        if (kernel.status.ok() && entry.passedCount && kernel.argumentCount != entry.passedCount) {
            kernel.status =
                Status("the kernel '" + std::get<1>(key) + "' of " + file + " takes " +
                       std::to_string(kernel.argumentCount) +
                       " arguments, and its deformer passes " + std::to_string(entry.passedCount));
        }
        if (kernel.status.ok()) {
            replaced[key] = std::move(kernel.kernel);
            programs.insert(std::get<2>(key));
        } else if (entry.keeper.get()) {
            return kernel.status;
        } else {
            failed = std::move(kernel.status);
        }
    }
    if (replaced.empty())
        return failed;
    fTexts.insert_or_assign(file, std::move(next));
    for (auto& [key, kernel] : replaced)
        fEntries.find(key)->second.keeper = std::move(kernel);
    fProgramsBuilt += programs.size();
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
