// Build options and work-group size of the deformers' kernels. Internal.
#pragma once

#include <cstddef>

namespace vyra {

// Build options of all programs. Without -cl-fast-relaxed-math, the documented error bounds of the
// deformers hold on every device.
inline constexpr const char* kKernelBuildOptions = "-cl-no-signed-zeros -Werror";

// Work-items. Smaller than some runtimes allow, so that one mesh occupies all compute units.
inline constexpr std::size_t kLargestWorkGroup = 256;

} // namespace vyra
