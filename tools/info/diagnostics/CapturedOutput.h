// Capture of the standard streams.
#pragma once

#include "tools/info/diagnostics/Platform.h"

#include <cstdio>
#include <string>

namespace info {

// Redirects standard output and standard error of the process, in one order, into a temporary file,
// from construction to finish() or destruction. A file, since nothing reads in the meantime and a
// pipe would fill up. If no file can be created, the streams stay as they are.
//
// No other thread may use the streams meanwhile. Objects may be nested.
class CapturedOutput {
public:
    CapturedOutput();
    ~CapturedOutput();
    CapturedOutput(const CapturedOutput&) = delete;
    CapturedOutput& operator=(const CapturedOutput&) = delete;

    // Restores the streams and returns the text written to them.
    [[nodiscard]] std::string finish();

private:
    void restore();

    std::FILE* fFile = nullptr;
    StandardStreams fStreams; // the original ones
};

} // namespace info
