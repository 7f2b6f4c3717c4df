// Whose graphics adapter an OpenGL context renders on.
#pragma once

#include <optional>
#include <string_view>

namespace viewer {

// The PCI vendor id of the adapter behind the GL_VENDOR and GL_RENDERER texts. Empty for a software
// renderer and for a vendor whose OpenCL the library does not choose by id.
std::optional<unsigned> pciVendorId(std::string_view glVendor, std::string_view glRenderer);

} // namespace viewer
