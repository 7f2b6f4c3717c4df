// The receiver of the library's warnings.
#pragma once

#include "VyraOpenCLExport.h"

// A function that receives one warning: a failed OpenCL call, or the build log of a program that
// does not compile. `text` is NUL-terminated, never null, and valid only during the call.
//
// Called by the operation that reports, on that operation's thread; several threads may call at the
// same time. Some operations hold a lock during the call, so a sink calls no function of the
// library except CLErrorCodeStr and setCLWarningSink. A sink must not throw.
using CLWarningSink = void (*)(const char* text);

// Replaces the receiver of all warnings of the process; null restores the built-in sink, which
// writes nothing. Returns the previous sink, null for the built-in one. Never fails.
//
// Safe from any thread, also before TopenCLInfo::initialize; concurrent calls take effect in some
// order. A warning that another thread reports at the same time may still reach the previous sink,
// so the code of that sink must stay loaded.
VYRA_OPENCL_API CLWarningSink setCLWarningSink(CLWarningSink sink);
