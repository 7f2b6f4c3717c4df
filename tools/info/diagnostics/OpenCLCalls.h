// OpenCL functions that the library does not call and this tool does.
#pragma once

#include <CL/cl.h>

namespace info {

// Looked up where the library looks; null where the OpenCL library lacks one. The members have the
// names and types of the functions.
struct OpenCLCalls {
    decltype(&::clGetDeviceIDs) clGetDeviceIDs = nullptr;
};

OpenCLCalls findOpenCLCalls();

} // namespace info
