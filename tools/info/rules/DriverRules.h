// The rules for NVIDIA's drivers, applied to the chosen device.
#pragma once

#include "runtime/DriverVersion.h"
#include "tools/info/diagnostics/Diagnostics.h"

#include <optional>

namespace info {

// Returns the library's verdict on the driver of the chosen device, for this value of
// VYRA_OPENCL_IGNORE_DRIVER_VERSION. Empty if no rule applies: another vendor, no device, or a
// version text that cannot be parsed.
[[nodiscard]] std::optional<DriverVerdict> judgeChosenDriver(const Diagnostics& diagnostics,
                                                             std::optional<int> ignoreVersion);

} // namespace info
