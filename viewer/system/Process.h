// Operations on this process that differ between operating systems.
#pragma once

#include <cstdio>

namespace viewer {

// Returns a binary stream to standard output, null on failure. From then on, what libraries print
// to standard output goes to standard error. The caller closes the stream.
[[nodiscard]] std::FILE* takeStandardOutput() noexcept;

// Limits this process to half of the machine's memory, since its parent needs a copy of the result,
// and disables core files. Does nothing on Windows.
void limitResources() noexcept;

// Returns whether a small allocation fails. Always false on Windows. Safe in a signal handler.
[[nodiscard]] bool memoryIsShort() noexcept;

// Makes a crash that is caused by lack of memory, mostly in a driver that does not check
// allocations, end the process with `text` on standard error and `exitCode`. Other crashes are not
// affected. `text` must have static storage duration. Compilers of drivers replace the signal
// handlers: call it again after they ran. Does nothing on Windows.
void reportCrashWithoutMemory(const char* text, int exitCode) noexcept;

} // namespace viewer
