// Implements LibraryFunctions.h for Windows.
#include "core/LibraryFunctions.h"

#include <windows.h>

namespace glshare {

LibraryFunctions::LibraryFunctions(const char* fileName) : library_(LoadLibraryA(fileName)) {}

void* LibraryFunctions::address(const char* name) const
{
    if (library_ == nullptr)
        return nullptr;
    return reinterpret_cast<void*>(GetProcAddress(static_cast<HMODULE>(library_), name));
}

void callAtExit(void (* /*call*/)()) {}

bool callInForkedChild(void (* /*call*/)())
{
    return true;
}

} // namespace glshare
