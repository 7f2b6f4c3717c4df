#include "viewer/GraphicsVendor.h"

namespace viewer {
namespace {

struct Vendor {
    std::string_view mark; // in either text
    unsigned pciId;
};

// Vendors' own drivers name themselves in GL_VENDOR, Mesa's name the hardware in GL_RENDERER.
constexpr Vendor kVendors[] = {
    {"NVIDIA", 0x10DE}, {"ATI Technologies", 0x1002}, {"AMD", 0x1002}, {"Radeon", 0x1002},
    {"Intel", 0x8086},
};

// Mesa's software renderers may name the processor that they run on, an AMD or Intel one.
constexpr std::string_view kSoftwareRenderers[] = {"llvmpipe", "softpipe", "swrast", "Software"};

bool contains(std::string_view text, std::string_view part)
{
    return text.find(part) != std::string_view::npos;
}

} // namespace

std::optional<unsigned> pciVendorId(std::string_view glVendor, std::string_view glRenderer)
{
    for (const std::string_view software : kSoftwareRenderers) {
        if (contains(glRenderer, software))
            return std::nullopt;
    }
    for (const Vendor& vendor : kVendors) {
        if (contains(glVendor, vendor.mark) || contains(glRenderer, vendor.mark))
            return vendor.pciId;
    }
    return std::nullopt;
}

} // namespace viewer
