// What the operating system does differently for a process elsewhere.
#pragma once

#include <cstdio>

namespace viewer {

// Returns a binary stream to the standard output that the parent reads. What libraries print to
// standard output goes to standard error from then on. Null on failure.
std::FILE* takeStandardOutput();

// Limits this process to half of the machine's memory, since its parent needs a copy of the result,
// and prevents a core file when it crashes.
void limitResources();

// Returns whether the process cannot get even a little memory.
bool memoryIsShort();

// Makes a crash that follows from a lack of memory, mostly in a driver that does not expect it, end
// the process with this text on standard error and this exit code. Other crashes stay what they
// are. `text` is a constant. Compilers of drivers replace the handlers: call it again after they
// ran.
void reportCrashWithoutMemory(const char* text, int exitCode);

} // namespace viewer
