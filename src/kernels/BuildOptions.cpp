// Part of TopenCLKernelStore: the option string of a build, which is also half of a program's key.
#include "host/TstringArray.h"
#include "kernels/TopenCLKernelStore.h"
#include "runtime/TopenCLInfo.h"

namespace {

// What a caller without wishes of its own gets: fast arithmetic, and warnings that stop the build.
constexpr const char* kDefaultFlags =
    "-cl-fast-relaxed-math -cl-mad-enable -cl-no-signed-zeros -Werror";

// `dir` without the spaces around it, in double quotes when there are spaces in it.
Tstring quoteIncludePath(const Tstring& dir)
{
    Tstring trimmed = dir;
    trimmed.removeInitialAndFinalSpaces();
    if (trimmed.findMB(L' ', 0) == -1)
        return trimmed;
    Tstring quoted("\"");
    quoted += trimmed;
    quoted += "\"";
    return quoted;
}

} // namespace

Tstring TopenCLKernelStore::expandBuildFlags(const char* flags, const TstringArray* includeDirs)
{
    Tstring options(flags ? flags : kDefaultFlags);
    if (includeDirs) {
        for (unsigned int index = 0; index < includeDirs->length(); ++index) {
            options += " -I ";
            options += quoteIncludePath((*includeDirs)[index]);
        }
    }
    if (TopenCLInfo::theOne().supportsDoublePrecision())
        options += " -D SupportsDoublePrecision";
    return options;
}
