#include "tools/info/diagnostics/CapturedOutput.h"

#include <array>

namespace info {

CapturedOutput::CapturedOutput() : fFile(openTemporaryFile())
{
    if (!fFile)
        return;
    std::fflush(stdout);
    std::fflush(stderr);
    fStreams = redirectStandardStreams(fFile);
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
    if (fStreams.output < 0)
        return;
    std::fflush(stdout);
    std::fflush(stderr);
    restoreStandardStreams(fStreams);
}

} // namespace info
