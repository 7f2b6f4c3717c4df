#include "tools/info/diagnostics/WarningLog.h"

#include <utility>

namespace info {

constinit WarningLog* WarningLog::sfReceiver = nullptr;

WarningLog::WarningLog()
{
    sfReceiver = this;
    fSinkBefore = setCLWarningSink(keep);
}

WarningLog::~WarningLog()
{
    setCLWarningSink(fSinkBefore);
    sfReceiver = nullptr;
}

std::vector<std::string> WarningLog::take()
{
    const std::scoped_lock lock(fMutex);
    return std::exchange(fTexts, {});
}

void WarningLog::keep(const char* text)
{
    std::string warning = text;
    while (warning.ends_with('\n'))
        warning.pop_back();
    const std::scoped_lock lock(sfReceiver->fMutex);
    sfReceiver->fTexts.push_back(std::move(warning));
}

} // namespace info
