// The library's warnings, kept instead of dropped.
#pragma once

#include <mutex>
#include <string>
#include <vector>

namespace info {

// While an object lives it is the receiver of the library's warnings, on any thread. One at a time.
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

    std::mutex fMutex;
    std::vector<std::string> fTexts; // guarded by fMutex
};

} // namespace info
