// Direct3D 11 buffer sharing by copying: cl_khr_d3d11_sharing, or with GLSHARE_D3D11=nv its older
// relative cl_nv_d3d11_sharing, whose functions have the same signatures. GLSHARE_D3D11=0 offers
// neither.
//
// An acquire waits for its wait list and copies on the calling thread, and so does a release: the
// commands of the two sides are in order then. Textures are not offered.
#pragma once

#include "core/api/OpenCl.h"

#include <string_view>

namespace glshare {

// Puts the context functions that know Direct3D devices in front of those in `table`, and adds the
// extension. Once, by the shell, after installEntryPoints.
void installDirect3D11(cl_icd_dispatch& table);

// The extension's function of that name, or null.
[[nodiscard]] void* findDirect3D11Function(std::string_view name);

} // namespace glshare
