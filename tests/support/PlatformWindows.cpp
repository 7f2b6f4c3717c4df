#include "Platform.h"

#include <cstdlib>

#include <windows.h>

void setEnvironment(const char* name, const char* value)
{
    _putenv_s(name, value ? value : "");
}

void* loadLibrary(const char* path)
{
    return LoadLibraryA(path);
}

void* symbolOf(void* library, const char* name)
{
    return reinterpret_cast<void*>(GetProcAddress(static_cast<HMODULE>(library), name));
}

void unloadLibrary(void* library)
{
    FreeLibrary(static_cast<HMODULE>(library));
}
