// Collects the library's warnings of one thread. Internal.
#pragma once

#include <string>

namespace vyra {

// A collection of the warnings that are issued on one thread while the object exists. The host's
// sink still receives every warning. At most one object per thread.
class WarningCapture {
public:
    WarningCapture();
    ~WarningCapture();
    WarningCapture(const WarningCapture&) = delete;
    WarningCapture& operator=(const WarningCapture&) = delete;

    // Returns the warnings so far, one per line.
    const std::string& text() const noexcept { return fText; }

private:
    std::string fText;
};

} // namespace vyra
