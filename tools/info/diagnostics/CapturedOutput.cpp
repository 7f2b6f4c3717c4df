#include "tools/info/diagnostics/CapturedOutput.h"

#include <array>

#include <unistd.h>

namespace info {

CapturedOutput::CapturedOutput() : fFile(std::tmpfile())
{
    if (!fFile)
        return;
    std::fflush(stdout);
    std::fflush(stderr);
    fOutput = dup(STDOUT_FILENO);
    fError = dup(STDERR_FILENO);
    dup2(fileno(fFile), STDOUT_FILENO);
    dup2(fileno(fFile), STDERR_FILENO);
}

CapturedOutput::~CapturedOutput()
{
    restore();
    if (fFile)
        std::fclose(fFile);
}

std::string CapturedOutput::finish()
{
    restore();
    std::string text;
    if (!fFile)
        return text;
    std::rewind(fFile);
    std::array<char, 4096> part{};
    while (const std::size_t size = std::fread(part.data(), 1, part.size(), fFile))
        text.append(part.data(), size);
    return text;
}

void CapturedOutput::restore()
{
    if (fOutput < 0)
        return;
    std::fflush(stdout);
    std::fflush(stderr);
    dup2(fOutput, STDOUT_FILENO);
    dup2(fError, STDERR_FILENO);
    close(fOutput);
    close(fError);
    fOutput = -1;
    fError = -1;
}

} // namespace info
