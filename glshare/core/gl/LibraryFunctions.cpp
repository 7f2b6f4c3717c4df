#include "core/gl/LibraryFunctions.h"

#include <dlfcn.h>

namespace glshare {

LibraryFunctions::LibraryFunctions(const char* fileName) noexcept
    : fLibrary(dlopen(fileName, RTLD_LAZY))
{
}

void* LibraryFunctions::address(const char* name) const noexcept
{
    return fLibrary == nullptr ? nullptr : dlsym(fLibrary, name);
}

} // namespace glshare
