#include "Platform.h"

#include <cstdlib>

#include <dlfcn.h>

void setEnvironment(const char* name, const char* value)
{
    value ? setenv(name, value, 1) : unsetenv(name);
}

void* loadLibrary(const char* path)
{
    return dlopen(path, RTLD_NOW | RTLD_LOCAL);
}

void* symbolOf(void* library, const char* name)
{
    return dlsym(library, name);
}

void unloadLibrary(void* library)
{
    dlclose(library);
}
