// The reasons why start-up rejects platforms and devices.
#pragma once

#include "tools/info/diagnostics/Diagnostics.h"

#include <string>

namespace info {

// Return the first test that failed. Empty if the platform or device was chosen.
[[nodiscard]] std::string platformRejection(const Diagnostics& diagnostics,
                                            const Platform& platform);
// `device` belongs to `platform`.
[[nodiscard]] std::string deviceRejection(const Diagnostics& diagnostics, const Platform& platform,
                                          const Device& device);

// Describes how the renderer's GPU and the chosen device differ. Empty if they are the same GPU.
[[nodiscard]] std::string rendererDeviceMismatch(const Diagnostics& diagnostics);

} // namespace info
