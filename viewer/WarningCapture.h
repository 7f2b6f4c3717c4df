// Collects the library's warnings of one thread.
#pragma once

#include <string>

namespace viewer {

// While an object lives, the warnings of its own thread are collected. The warnings of every thread
// still reach the sink that was installed before, which is restored when the last object goes. At
// most one object per thread.
class WarningCapture {
public:
    WarningCapture();
    ~WarningCapture();
    WarningCapture(const WarningCapture&) = delete;
    WarningCapture& operator=(const WarningCapture&) = delete;

    // The warnings so far, one per line.
    const std::string& text() const { return fText; }

private:
    std::string fText;
};

} // namespace viewer
