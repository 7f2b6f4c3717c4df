#include "tools/info/diagnostics/WarningLog.h"

#include "diagnostics/CLStatusReport.h"

#include <utility>

namespace info {

constinit WarningLog* WarningLog::sfCurrent = nullptr;

WarningLog::WarningLog()
{
    sfCurrent = this;
    fSinkBefore = setCLWarningSink(add);
}

WarningLog::~WarningLog()
{
    setCLWarningSink(fSinkBefore);
    sfCurrent = nullptr;
}

std::vector<Warning> WarningLog::take()
{
    const std::scoped_lock lock(fMutex);
    return std::exchange(fWarnings, {});
}

void WarningLog::add(const char* text)
{
    Warning warning{text, reportedStatus(), startUpStep()};
    while (warning.text.ends_with('\n'))
        warning.text.pop_back();
    const std::scoped_lock lock(sfCurrent->fMutex);
    sfCurrent->fWarnings.push_back(std::move(warning));
}

} // namespace info
