// The OpenCL functions that the viewer calls itself, looked up at run time.
#pragma once

#include "viewer/Failure.h"

#include <CL/cl.h>

namespace viewer {

// The library enqueues nothing but transfers, acquires and releases: kernels and copies are the
// application's own calls. Nothing links the OpenCL loader, so that a machine without OpenCL can be
// told so in a sentence. The members have the names and types of the functions.
struct OpenCLFunctions {
    decltype(&::clGetPlatformIDs) clGetPlatformIDs = nullptr;
    decltype(&::clGetPlatformInfo) clGetPlatformInfo = nullptr;
    decltype(&::clGetDeviceInfo) clGetDeviceInfo = nullptr;
    decltype(&::clGetKernelInfo) clGetKernelInfo = nullptr;
    decltype(&::clCreateCommandQueue) clCreateCommandQueue = nullptr;
    decltype(&::clReleaseCommandQueue) clReleaseCommandQueue = nullptr;
    decltype(&::clSetKernelArg) clSetKernelArg = nullptr;
    decltype(&::clEnqueueNDRangeKernel) clEnqueueNDRangeKernel = nullptr;
    decltype(&::clEnqueueCopyBuffer) clEnqueueCopyBuffer = nullptr;
    decltype(&::clEnqueueMarkerWithWaitList) clEnqueueMarkerWithWaitList = nullptr;
    decltype(&::clGetEventProfilingInfo) clGetEventProfilingInfo = nullptr;
    decltype(&::clWaitForEvents) clWaitForEvents = nullptr;
    decltype(&::clFlush) clFlush = nullptr;
    decltype(&::clFinish) clFinish = nullptr;
};

// Opens the OpenCL loader, which stays open until the process ends.
Result<OpenCLFunctions> loadOpenCLFunctions();

} // namespace viewer
