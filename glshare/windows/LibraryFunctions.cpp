// Implements LibraryFunctions.h for Windows.
#include "core/gl/LibraryFunctions.h"

#include <windows.h>

namespace glshare {

LibraryFunctions::LibraryFunctions(const char* fileName) noexcept : fLibrary(LoadLibraryA(fileName))
{
}

void* LibraryFunctions::address(const char* name) const noexcept
{
    if (fLibrary == nullptr)
        return nullptr;
    return reinterpret_cast<void*>(GetProcAddress(static_cast<HMODULE>(fLibrary), name));
}

} // namespace glshare
