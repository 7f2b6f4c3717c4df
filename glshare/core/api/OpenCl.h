// The OpenCL interface as this program sees it: the newest headers, whatever version the rest of
// the build targets, and the table of functions that calls are passed down to.
#pragma once

#undef CL_TARGET_OPENCL_VERSION
#define CL_TARGET_OPENCL_VERSION 300
#include <CL/cl.h>
#include <CL/cl_gl.h>
#include <CL/cl_icd.h>

namespace glshare {

// The functions of whatever lies below: another layer, or the runtime itself. Valid from the moment
// the shell has called setRuntime, which is before the application's first OpenCL call returns.
// Nothing here calls the OpenCL library's exported functions: those would come back to this
// program.
const cl_icd_dispatch& runtime();

// Called once by the shell. The table is copied.
void setRuntime(const cl_icd_dispatch& table);

} // namespace glshare
