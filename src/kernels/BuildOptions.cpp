// Part of TopenCLKernelStore: the option string of a build, which is part of a program's key.
#include "host/TstringArray.h"
#include "kernels/TopenCLKernelStore.h"
#include "runtime/TopenCLInfo.h"

namespace {

// The options for callers that pass none: fast arithmetic, and warnings as errors.
constexpr const char* kDefaultFlags =
    "-cl-fast-relaxed-math -cl-mad-enable -cl-no-signed-zeros -Werror";

// Returns `dir` without spaces at its ends, in double quotes if it contains spaces.
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
