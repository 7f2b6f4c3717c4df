// Direct3D 11 buffer sharing by copies: cl_khr_d3d11_sharing, or with GLSHARE_D3D11=nv the older
// cl_nv_d3d11_sharing, whose functions have the same signatures. GLSHARE_D3D11=0 disables both.
//
// Acquire and release wait for their wait list and copy on the calling thread, so that OpenCL and
// Direct3D commands are in order. Textures are not supported.
#pragma once

#include "core/api/OpenCl.h"

#include <string_view>

namespace glshare {

// Replaces the functions in `table` that create contexts and look up extension functions, and adds
// the extension. Called once, after installEntryPoints.
void installDirect3D11(cl_icd_dispatch& table);

// Returns the extension's function of that name; null if there is none.
[[nodiscard]] void* findDirect3D11Function(std::string_view name);

} // namespace glshare
