#include "tools/info/diagnostics/Platform.h"

#include <cstdlib>

#include <dlfcn.h>
#include <unistd.h>

namespace info {

std::vector<std::string> environmentEntries()
{
    std::vector<std::string> entries;
    for (char** entry = environ; *entry; ++entry)
        entries.emplace_back(*entry);
    return entries;
}

void setEnvironmentVariable(const char* name, const std::string& value)
{
    setenv(name, value.c_str(), 1);
}

const char* defaultWindowSystems()
{
    return std::getenv("WAYLAND_DISPLAY") ? "xcb;wayland" : "xcb";
}

void clearLibraryError()
{
    dlerror();
}

std::string libraryError()
{
    const char* error = dlerror();
    return error ? error : "the system reports no reason";
}

std::string fileOfFunction(void* function)
{
    Dl_info where{};
    return function && dladdr(function, &where) && where.dli_fname ? where.dli_fname : "";
}

std::FILE* openTemporaryFile()
{
    return std::tmpfile();
}

StandardStreams redirectStandardStreams(std::FILE* file)
{
    const StandardStreams streams{dup(STDOUT_FILENO), dup(STDERR_FILENO)};
    dup2(fileno(file), STDOUT_FILENO);
    dup2(fileno(file), STDERR_FILENO);
    return streams;
}

void restoreStandardStreams(StandardStreams& streams)
{
    dup2(streams.output, STDOUT_FILENO);
    dup2(streams.error, STDERR_FILENO);
    close(streams.output);
    close(streams.error);
    streams = {};
}

} // namespace info
