// The newest OpenCL headers, whatever version the rest of the build targets, and the table of the
// underlying OpenCL functions.
#pragma once

#undef CL_TARGET_OPENCL_VERSION
#define CL_TARGET_OPENCL_VERSION 300
#include <CL/cl.h>
#include <CL/cl_gl.h>
#include <CL/cl_icd.h>

namespace glshare {

// Returns the functions of the layer below, which is another layer or the OpenCL runtime. Valid
// once setRuntime has been called. glshare calls these only: the OpenCL library's exported
// functions would call glshare again. Any thread.
[[nodiscard]] const cl_icd_dispatch& runtime() noexcept;

// Copies `table`. Called by layer/ or windows/, before the first OpenCL call of the application
// returns.
void setRuntime(const cl_icd_dispatch& table) noexcept;

} // namespace glshare
