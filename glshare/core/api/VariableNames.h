// The names of the environment variables that glshare reads.
#pragma once

namespace glshare {

inline constexpr const char* kGlEventVariable = "GLSHARE_GL_EVENT";
inline constexpr const char* kCpuAsGpuVariable = "GLSHARE_CPU_AS_GPU";
inline constexpr const char* kZeroCopyVariable = "GLSHARE_ZERO_COPY";
inline constexpr const char* kDirect3D11Variable = "GLSHARE_D3D11"; // Windows only

} // namespace glshare
