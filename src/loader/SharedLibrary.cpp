#include "loader/SharedLibrary.h"

#if defined(_WIN32)

#include <windows.h>

void* openSharedLibrary(const char* name)
{
    return LoadLibraryA(name);
}

void* findSymbol(void* library, const char* name)
{
    return reinterpret_cast<void*>(GetProcAddress(static_cast<HMODULE>(library), name));
}

#else

#include <dlfcn.h>

void* openSharedLibrary(const char* name)
{
    return dlopen(name, RTLD_NOW | RTLD_LOCAL);
}

void* findSymbol(void* library, const char* name)
{
    return dlsym(library, name);
}

#endif
