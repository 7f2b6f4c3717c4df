#include "core/LibraryFunctions.h"

#include <dlfcn.h>

namespace glshare {

LibraryFunctions::LibraryFunctions(const char* fileName) : library_(dlopen(fileName, RTLD_LAZY)) {}

void* LibraryFunctions::address(const char* name) const
{
    return library_ == nullptr ? nullptr : dlsym(library_, name);
}

} // namespace glshare
