// The one entry point of the library's warnings.
#pragma once

#include "VyraOpenCLExport.h"

// Formats a printf-style message, whole and of any length, and hands it to the warning sink. The
// built-in sink writes nothing. Never fails towards its caller: a message that cannot be formatted
// is handed on empty. Safe from any thread.
[[gnu::format(printf, 1, 2)]] VYRA_OPENCL_API void CLInternalWarning(const char* format, ...);
