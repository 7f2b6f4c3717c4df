// Reports of OpenCL statuses as warnings. Internal.
#pragma once

#include <CL/cl.h>

// The reports of the runtime object end with a line break, all others do not.
enum class CLReportStyle { kPlain, kWithLineBreak };

// Reports a `status` other than CL_SUCCESS as a warning with the code's name.
void reportFailure(cl_int status, CLReportStyle style = CLReportStyle::kPlain);

// Returns the status that reportFailure is reporting on the calling thread, for warning sinks of
// this project's tools. CL_SUCCESS outside of a report.
cl_int reportedStatus() noexcept;

// Reports like reportFailure, and returns whether `status` is CL_SUCCESS.
[[nodiscard]] bool checkStatus(cl_int status, CLReportStyle style = CLReportStyle::kPlain);

// Waits for one event. Returns the status of the wait, after reporting a failure. Wraps
// clWaitForEvents.
cl_int waitForEvent(cl_event event);
