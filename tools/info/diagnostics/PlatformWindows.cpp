#include "tools/info/diagnostics/Platform.h"

#include <array>
#include <cstdlib>

#include <windows.h>

#include <io.h>

namespace info {

std::vector<std::string> environmentEntries()
{
    std::vector<std::string> entries;
    for (char** entry = _environ; *entry; ++entry)
        entries.emplace_back(*entry);
    return entries;
}

void setEnvironmentVariable(const char* name, const std::string& value)
{
    _putenv_s(name, value.c_str());
}

const char* defaultWindowSystems()
{
    return "windows";
}

void clearLibraryError()
{
    SetLastError(ERROR_SUCCESS);
}

std::string libraryError()
{
    constexpr DWORD kFlags = FORMAT_MESSAGE_FROM_SYSTEM | FORMAT_MESSAGE_IGNORE_INSERTS;
    const DWORD error = GetLastError();
    std::array<char, 512> text{};
    DWORD length = 0;
    if (error != ERROR_SUCCESS)
        length = FormatMessageA(kFlags, nullptr, error, 0, text.data(),
                                static_cast<DWORD>(text.size()), nullptr);
    std::string reason(text.data(), length);
    reason.erase(reason.find_last_not_of(" .\r\n") + 1);
    return reason.empty() ? "the system reports no reason" : reason;
}

std::string fileOfFunction(void* function)
{
    constexpr DWORD kFlags =
        GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS | GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT;
    HMODULE module = nullptr;
    std::array<char, MAX_PATH> file{};
    if (!function || !GetModuleHandleExA(kFlags, static_cast<LPCSTR>(function), &module))
        return {};
    const DWORD length = GetModuleFileNameA(module, file.data(), static_cast<DWORD>(file.size()));
    return {file.data(), length};
}

// std::tmpfile makes its file in the root folder, where most users may not write.
std::FILE* openTemporaryFile()
{
    std::array<char, MAX_PATH + 1> folder{};
    std::array<char, MAX_PATH + 1> file{};
    if (GetTempPathA(static_cast<DWORD>(folder.size()), folder.data()) == 0 ||
        GetTempFileNameA(folder.data(), "vyr", 0, file.data()) == 0)
        return nullptr;
    return std::fopen(file.data(), "w+bTD"); // deleted when it is closed
}

StandardStreams redirectStandardStreams(std::FILE* file)
{
    const StandardStreams streams{_dup(_fileno(stdout)), _dup(_fileno(stderr))};
    _dup2(_fileno(file), _fileno(stdout));
    _dup2(_fileno(file), _fileno(stderr));
    return streams;
}

void restoreStandardStreams(StandardStreams& streams)
{
    _dup2(streams.output, _fileno(stdout));
    _dup2(streams.error, _fileno(stderr));
    _close(streams.output);
    _close(streams.error);
    streams = {};
}

} // namespace info
