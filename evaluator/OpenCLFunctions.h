// The OpenCL functions that the evaluator calls itself, resolved at run time. Internal.
#pragma once

#include <CL/cl.h>

namespace vyra {

// The library enqueues transfers, acquires and releases; kernels and copies are the evaluator's
// calls. Nothing links the OpenCL loader. The members have the names and types of the functions.
struct OpenCLFunctions {
    decltype(&::clGetMemObjectInfo) clGetMemObjectInfo = nullptr;
    decltype(&::clGetEventInfo) clGetEventInfo = nullptr;
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

// The functions of the OpenCL library, which is opened by the first call and stays open. Null if
// it cannot be opened or lacks one of them. Safe from any thread.
[[nodiscard]] const OpenCLFunctions* openCLFunctions();

} // namespace vyra
