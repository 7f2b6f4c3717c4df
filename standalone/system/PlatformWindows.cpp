#include "standalone/system/Platform.h"

#include <windows.h>

#include <string>
#include <system_error>

namespace vyra::host {

void* symbolOfLoadedLibrary(const char* name, const char* symbol)
{
    const HMODULE library = GetModuleHandleA(name);
    return library ? reinterpret_cast<void*>(GetProcAddress(library, symbol)) : nullptr;
}

std::filesystem::path fileOfThisLibrary()
{
    static const char addressInThisLibrary = 0;
    HMODULE library = nullptr;
    if (!GetModuleHandleExW(GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS |
                                GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT,
                            reinterpret_cast<LPCWSTR>(&addressInThisLibrary), &library)) {
        return {};
    }
    std::wstring file(MAX_PATH, L'\0');
    // A name as long as the buffer has been truncated.
    while (true) {
        const DWORD length =
            GetModuleFileNameW(library, file.data(), static_cast<DWORD>(file.size()));
        if (length < file.size()) {
            file.resize(length);
            break;
        }
        file.resize(2 * file.size());
    }
    std::error_code error;
    return std::filesystem::canonical(file, error);
}

} // namespace vyra::host
