// Collects the library's warnings of one thread. Internal.
#pragma once

#include <string>

namespace vyra {

// While an object lives, warnings that are issued on its thread are collected. Every warning still
// reaches the sink that the host installed. At most one object per thread.
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

} // namespace vyra
