// Log of the library's warnings.
#pragma once

#include "diagnostics/CLWarningSink.h"

#include <mutex>
#include <string>
#include <vector>

namespace info {

// Replaces the library's warning sink while an object lives, and keeps the texts of all threads.
// One object at a time.
class WarningLog {
public:
    WarningLog();
    ~WarningLog();
    WarningLog(const WarningLog&) = delete;
    WarningLog& operator=(const WarningLog&) = delete;

    // The warnings since the last take, each without the line break at its end.
    std::vector<std::string> take();

private:
    static void keep(const char* text);

    static WarningLog* sfReceiver;

    CLWarningSink fSinkBefore;
    std::mutex fMutex;
    std::vector<std::string> fTexts; // guarded by fMutex
};

} // namespace info
