// Implements LibraryFunctions.h for Windows.
#include "core/gl/LibraryFunctions.h"

#include <windows.h>

namespace glshare {

LibraryFunctions::LibraryFunctions(const char* fileName) : fLibrary(LoadLibraryA(fileName)) {}

void* LibraryFunctions::address(const char* name) const
{
    if (fLibrary == nullptr)
        return nullptr;
    return reinterpret_cast<void*>(GetProcAddress(static_cast<HMODULE>(fLibrary), name));
}

void callAtExit(void (* /*call*/)()) {}

bool callInForkedChild(void (* /*call*/)())
{
    return true;
}

} // namespace glshare
