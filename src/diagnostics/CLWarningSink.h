// The receiver of the library's warnings.
#pragma once

#include "VyraOpenCLExport.h"

// Takes one finished warning: a failed OpenCL call, or the build log of a program that does not
// compile. `text` is NUL-terminated, never null, and valid during the call only.
//
// Runs inside the operation that reports, on that operation's thread; several threads may call at
// once. Some operations hold a lock meanwhile, so a sink must not call the library, apart from
// CLErrorCodeStr and setCLWarningSink. A sink must not throw.
using CLWarningSink = void (*)(const char* text);

// Makes `sink` the receiver of all warnings of the process; null restores the built-in sink, which
// writes nothing. Returns the sink before, null for the built-in one. Never fails.
//
// Safe from any thread, before TopenCLInfo::initialize too; concurrent calls replace one another in
// some order. A warning that another thread reports at the same moment may still reach the sink
// before, so the code of that sink must stay loaded.
VYRA_OPENCL_API CLWarningSink setCLWarningSink(CLWarningSink sink);
