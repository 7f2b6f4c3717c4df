// From an OpenCL status to a report: the only place that knows how. Internal.
#pragma once

#include <cstddef>

#include <CL/cl.h>

// How a report ends: the runtime's set-up ends its reports with a line break, everything else does
// not.
enum class CLReportStyle { kPlain, kSetUp };

// Reports a `status` other than CL_SUCCESS as a warning with the code's name. Returns whether
// `status` is CL_SUCCESS, so that a step can stop on it; ignoring the result means going on.
bool succeeded(cl_int status, CLReportStyle style = CLReportStyle::kPlain);

// What the runtime calls with an error of a context, on any thread: writes `errorInfo` to the
// standard error stream.
void CL_CALLBACK contextErrorCallback(const char* errorInfo, const void* privateInfo,
                                      std::size_t privateInfoSize, void* userData);
