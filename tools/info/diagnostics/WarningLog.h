// Log of the library's warnings.
#pragma once

#include "diagnostics/CLWarningSink.h"
#include "tools/info/diagnostics/Diagnostics.h"

#include <mutex>
#include <vector>

namespace info {

// Collects the warnings of all threads: the library's warning sink from construction to
// destruction, which restores the sink before. One object at a time.
class WarningLog {
public:
    WarningLog();
    ~WarningLog();
    WarningLog(const WarningLog&) = delete;
    WarningLog& operator=(const WarningLog&) = delete;

    // Returns the warnings since the last call, each without the line break at its end.
    [[nodiscard]] std::vector<Warning> take();

private:
    static void add(const char* text);

    static WarningLog* sfCurrent;

    CLWarningSink fSinkBefore;
    std::mutex fMutex;
    std::vector<Warning> fWarnings; // guarded by fMutex
};

} // namespace info
