#include "core/LibraryFunctions.h"

#include <cstdlib>

#include <dlfcn.h>
#include <pthread.h>

namespace glshare {

LibraryFunctions::LibraryFunctions(const char* fileName) : library_(dlopen(fileName, RTLD_LAZY)) {}

void* LibraryFunctions::address(const char* name) const
{
    return library_ == nullptr ? nullptr : dlsym(library_, name);
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
