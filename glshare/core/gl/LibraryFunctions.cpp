#include "core/gl/LibraryFunctions.h"

#include <cstdlib>

#include <dlfcn.h>
#include <pthread.h>

namespace glshare {

LibraryFunctions::LibraryFunctions(const char* fileName) : fLibrary(dlopen(fileName, RTLD_LAZY)) {}

void* LibraryFunctions::address(const char* name) const
{
    return fLibrary == nullptr ? nullptr : dlsym(fLibrary, name);
}

void callAtExit(void (*call)())
{
    std::atexit(call);
}

bool callInForkedChild(void (*call)())
{
    return pthread_atfork(nullptr, nullptr, call) == 0;
}

} // namespace glshare
