// The OpenCL functions that the viewer calls itself, looked up at run time.
#pragma once

#include "viewer/Failure.h"

#include <CL/cl.h>

namespace viewer {

// The queries that choose a platform before the library starts. Nothing links the OpenCL loader, so
// that the viewer can report its absence in a sentence. The members have the names and types of the
// functions.
struct OpenCLFunctions {
    decltype(&::clGetPlatformIDs) clGetPlatformIDs = nullptr;
    decltype(&::clGetPlatformInfo) clGetPlatformInfo = nullptr;
    decltype(&::clGetDeviceInfo) clGetDeviceInfo = nullptr;
};

// Opens the OpenCL loader, which stays open until the process ends.
Result<OpenCLFunctions> loadOpenCLFunctions();

} // namespace viewer
