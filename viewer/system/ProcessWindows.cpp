#include "viewer/system/Process.h"

#include <fcntl.h>
#include <io.h>

namespace viewer {

std::FILE* takeStandardOutput() noexcept
{
    const int output = _dup(_fileno(stdout));
    if (output < 0 || _dup2(_fileno(stderr), _fileno(stdout)) < 0 ||
        _setmode(output, _O_BINARY) < 0)
        return nullptr;
    return _fdopen(output, "wb");
}

// Windows does not overcommit memory and writes no core files.
void limitResources() noexcept {}

bool memoryIsShort() noexcept
{
    return false;
}

// No driver is known to crash on Windows when memory runs out.
void reportCrashWithoutMemory(const char*, int) noexcept {}

} // namespace viewer
