// The collection of all diagnostics except the self-test.
#pragma once

#include "tools/info/Options.h"
#include "tools/info/diagnostics/Diagnostics.h"

namespace info {

class RenderWindow;
class WarningLog;

// Reads the environment, starts the library for `window`, and queries platforms and devices. Sets
// VYRA_OPENCL_PLATFORM for --platform, as the user of a host application would. Once in a process,
// on the main thread.
[[nodiscard]] Diagnostics collectDiagnostics(const Options& options, RenderWindow& window,
                                             WarningLog& warnings);

} // namespace info
