#include "viewer/system/Process.h"

#include <fcntl.h>
#include <io.h>

namespace viewer {

std::FILE* takeStandardOutput()
{
    const int output = _dup(_fileno(stdout));
    if (output < 0 || _dup2(_fileno(stderr), _fileno(stdout)) < 0 ||
        _setmode(output, _O_BINARY) < 0)
        return nullptr;
    return _fdopen(output, "wb");
}

// Windows refuses memory beyond what it can provide, and writes no core files.
void limitResources() {}

bool memoryIsShort()
{
    return false;
}

// Nothing is known of drivers that crash there.
void reportCrashWithoutMemory(const char*, int) {}

} // namespace viewer
