// How kernels are built and launched. Internal.
#pragma once

#include <cstddef>

namespace vyra {

// Build options of all programs. Without -cl-fast-relaxed-math: the bounds of the deformers' errors
// hold on every device.
inline constexpr const char* kKernelBuildOptions = "-cl-no-signed-zeros -Werror";

// Work-items. Smaller than what some runtimes allow, so that one mesh occupies all compute units.
inline constexpr std::size_t kLargestWorkGroup = 256;

} // namespace vyra
