#include "kernels/KernelStoreIndex.h"

#include "runtime/TopenCLInfo.h"

#include <algorithm>
#include <functional>

namespace {

std::string_view viewOf(const Tstring& text)
{
    return {text.asChar(), text.length()};
}

// Hashes only the last bytes, in which the files of a folder and the variants of a program differ:
// hashing the whole of long texts would cost more than the rest of a look-up.
std::size_t hashEnd(std::string_view text)
{
    constexpr std::size_t kHashed = 16;
    text.remove_prefix(text.size() - std::min(text.size(), kHashed));
    return std::hash<std::string_view>()(text);
}

bool sameTexts(const TstringArray& known, const TstringArray* requested)
{
    const unsigned int count = requested ? requested->length() : 0;
    if (known.length() != count)
        return false;
    for (unsigned int index = 0; index < count; ++index) {
        if (!(known[index] == (*requested)[index]))
            return false;
    }
    return true;
}

} // namespace

TopenCLKernelStore::Index::Request::Request(const char* programName, const char* buildFlags,
                                            const TstringArray* dirs)
    : name(programName ? programName : ""), flags(buildFlags ? buildFlags : ""),
      defaultFlags(!buildFlags), includeDirs(dirs),
      doublePrecision(TopenCLInfo::theOne().supportsDoublePrecision())
{
}

std::size_t TopenCLKernelStore::Index::Request::hash() const
{
    constexpr std::size_t kFactor = 31; // exchanging name and flags changes the hash
    return hashEnd(name) * kFactor + hashEnd(flags);
}

TopenCLKernelStore::Index::KnownRequest::KnownRequest(const Request& request,
                                                      ProgramInfo* itsProgram)
    : name(request.name.data()), flags(request.flags.data()), defaultFlags(request.defaultFlags),
      doublePrecision(request.doublePrecision), program(itsProgram)
{
    if (request.includeDirs)
        includeDirs = *request.includeDirs;
}

bool TopenCLKernelStore::Index::KnownRequest::operator==(const Request& request) const
{
    return viewOf(name) == request.name && viewOf(flags) == request.flags &&
           defaultFlags == request.defaultFlags && doublePrecision == request.doublePrecision &&
           sameTexts(includeDirs, request.includeDirs);
}

TopenCLKernelStore::ProgramInfo* TopenCLKernelStore::Index::find(const Request& request) const
{
    const auto [first, last] = fRequests.equal_range(request.hash());
    const auto found =
        std::find_if(first, last, [&](const auto& entry) { return entry.second == request; });
    return found == last ? nullptr : found->second.program;
}

TopenCLKernelStore::ProgramInfo* TopenCLKernelStore::Index::remember(const Request& request,
                                                                     ProgramInfo* program)
{
    if (program)
        fRequests.emplace(request.hash(), KnownRequest(request, program));
    return program;
}

void TopenCLKernelStore::Index::add(cl_kernel kernel, ProgramInfo& program)
{
    fKernels.push_back({kernel, &program});
}

TopenCLKernelStore::ProgramInfo* TopenCLKernelStore::Index::take(cl_kernel kernel)
{
    const auto found =
        std::find_if(fKernels.rbegin(), fKernels.rend(),
                     [&](const KernelInUse& entry) { return entry.kernel == kernel; });
    if (found == fKernels.rend())
        return nullptr;
    ProgramInfo* program = found->program;
    *found = fKernels.back();
    fKernels.pop_back();
    return program;
}

void TopenCLKernelStore::Index::forget(const ProgramInfo& program)
{
    std::erase_if(fRequests, [&](const auto& entry) { return entry.second.program == &program; });
    std::erase_if(fKernels, [&](const KernelInUse& entry) { return entry.program == &program; });
}
