// The name of the OpenCL device in use.
#pragma once

#include <string>

#include <CL/cl.h>

namespace viewer {

// Returns the device's CL_DEVICE_NAME; empty if it cannot be asked.
std::string deviceName(cl_device_id device);

} // namespace viewer
