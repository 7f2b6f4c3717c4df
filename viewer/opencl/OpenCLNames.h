// Names of the OpenCL device and the synchronisation modes, for the report and the overlay.
#pragma once

#include "runtime/TopenCLInfo.h"

#include <string>

#include <CL/cl.h>

namespace viewer {

// Returns the device's CL_DEVICE_NAME, empty if the query fails.
[[nodiscard]] std::string deviceName(cl_device_id device);

// Returns the number of the mode, as the environment variables take it, and its name.
[[nodiscard]] const char* nameOf(TopenCLInfo::GraphicsToCLSyncMode mode) noexcept;
[[nodiscard]] const char* nameOf(TopenCLInfo::CLToGraphicsSyncMode mode) noexcept;

} // namespace viewer
