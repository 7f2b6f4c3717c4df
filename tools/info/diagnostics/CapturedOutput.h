// What the process writes to its two standard streams for a while.
#pragma once

#include <cstdio>
#include <string>

namespace info {

// From construction to finish() (or the end of the object) standard output and standard error go,
// in one order, into a nameless temporary file, whichever code writes them. A file, since nobody
// reads meanwhile and a pipe would fill up. Where none can be made the streams stay as they are.
//
// One object at a time, while no other thread uses the streams.
class CapturedOutput {
public:
    CapturedOutput();
    ~CapturedOutput();
    CapturedOutput(const CapturedOutput&) = delete;
    CapturedOutput& operator=(const CapturedOutput&) = delete;

    // Puts the streams back and returns what was written.
    std::string finish();

private:
    void restore();

    std::FILE* fFile = nullptr;
    int fOutput = -1; // the streams that were there before
    int fError = -1;
};

} // namespace info
