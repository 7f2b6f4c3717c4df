// The rules for NVIDIA's drivers, applied to the chosen device.
#pragma once

#include "runtime/DriverVersion.h"
#include "tools/info/diagnostics/Diagnostics.h"

#include <optional>

namespace info {

// What the library holds of the device's driver with this value of
// VYRA_OPENCL_IGNORE_DRIVER_VERSION. Empty where no rule applies: another vendor, no device, or a
// version text that cannot be read.
std::optional<DriverVerdict> judgeChosenDriver(const Facts& facts,
                                               std::optional<int> ignoreVersion);

} // namespace info
