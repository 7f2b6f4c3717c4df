// From an OpenCL status to a report: the only place that knows how. Internal.
#pragma once

#include <CL/cl.h>

// The runtime object's own reports end with a line break, all others do not.
enum class CLReportStyle { kPlain, kWithLineBreak };

// Reports a `status` other than CL_SUCCESS as a warning with the code's name, and goes on.
void reportFailure(cl_int status, CLReportStyle style = CLReportStyle::kPlain);

// The same for a step that stops on a failure: returns whether `status` is CL_SUCCESS.
[[nodiscard]] bool succeeded(cl_int status, CLReportStyle style = CLReportStyle::kPlain);
