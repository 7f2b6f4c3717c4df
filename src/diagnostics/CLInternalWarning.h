// Reports the library's warnings.
#pragma once

#include "VyraOpenCLExport.h"

// Formats a printf-style message of any length without truncation and passes it to the warning
// sink (CLWarningSink.h); the built-in sink writes nothing. Never fails: passes an empty text if
// the message cannot be formatted. Safe from any thread.
#if defined(__GNUC__)
[[gnu::format(printf, 1, 2)]]
#endif
VYRA_OPENCL_API void
CLInternalWarning(const char* format, ...);
