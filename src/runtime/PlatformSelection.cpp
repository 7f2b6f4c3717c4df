// The choice of the platform, and the part of TopenCLInfo that searches for it.
#include "runtime/PlatformSelection.h"

#include "diagnostics/CLStatusReport.h"
#include "loader/OpenCLLoader.h"
#include "runtime/EnvironmentVariables.h"
#include "runtime/StartUpStep.h"
#include "runtime/TopenCLInfo.h"

#include <algorithm>
#include <array>
#include <cstdio>
#include <cstdlib>
#include <string>

constinit bool TopenCLInfo::sfListPlatforms = true;

namespace {

struct VendorName {
    const char* name;
    OpenCLProvider provider;
};

constexpr std::array<VendorName, 4> kVendorNames = {{
    {kNVIDIAVendor, kNVIDIAProvider},
    {kAMDVendor, kAMDProvider},
    {kIntelVendor, kIntelProvider},
    {kAppleVendor, kAppleProvider},
}};

struct VendorId {
    unsigned id;
    const char* name;
};

// PCI vendor ids.
constexpr std::array<VendorId, 4> kVendorIds = {{
    {0x10DE, kNVIDIAVendor},
    {0x1002, kAMDVendor},
    {0x3EA, kAMDVendor}, // decimal 1002
    {0x8086, kIntelVendor},
}};

bool readPlatformText(cl_platform_id platform, cl_platform_info name, Tstring& text)
{
    std::vector<char> value;
    if (!checkStatus(queryPlatformInfo(platform, name, value), CLReportStyle::kWithLineBreak))
        return false;
    text = platformText(value);
    return true;
}

// The texts by which a platform is listed and chosen.
struct PlatformNames {
    Tstring vendor;
    Tstring name;
    Tstring version;
};

bool readPlatformNames(cl_platform_id platform, PlatformNames& names)
{
    return readPlatformText(platform, CL_PLATFORM_VENDOR, names.vendor) &&
           readPlatformText(platform, CL_PLATFORM_NAME, names.name) &&
           readPlatformText(platform, CL_PLATFORM_VERSION, names.version);
}

} // namespace

std::optional<Tstring> chooseVendor(unsigned vendorId)
{
    if (const char* forced = std::getenv(kPlatformVariable))
        return Tstring(forced);
    for (const VendorId& vendor : kVendorIds) {
        if (vendor.id == vendorId)
            return Tstring(vendor.name);
    }
    std::fprintf(
        stderr,
        "OpenCL evaluator encountered an unknown vendor id %x while trying to initialize OpenCL.\n",
        vendorId);
    return std::nullopt;
}

OpenCLProvider providerOfVendor(const Tstring& vendor)
{
    for (const VendorName& known : kVendorNames) {
        if (vendor == Tstring(known.name))
            return known.provider;
    }
    return kUnknownProvider;
}

cl_int queryPlatformInfo(cl_platform_id platform, cl_platform_info name, std::vector<char>& value)
{
    std::size_t size = 0;
    const cl_int status = ocl.clGetPlatformInfo(platform, name, 0, nullptr, &size);
    if (status != CL_SUCCESS)
        return status;
    value.resize(size);
    return ocl.clGetPlatformInfo(platform, name, size, value.data(), nullptr);
}

Tstring platformText(const std::vector<char>& value)
{
    return Tstring(std::string(value.begin(), std::find(value.begin(), value.end(), '\0')).c_str());
}

bool TopenCLInfo::findPlatformByVendor(const Tstring& vendor, cl_platform_id& platform,
                                       Tstring& extensions)
{
    enterStartUpStep(StartUpStep::kPlatform);
    cl_uint count = 0;
    if (ocl.clGetPlatformIDs(0, nullptr, &count) != CL_SUCCESS || count == 0)
        return false;
    std::vector<cl_platform_id> platforms(count);
    if (!checkStatus(ocl.clGetPlatformIDs(count, platforms.data(), nullptr),
                     CLReportStyle::kWithLineBreak))
        return false;

    if (sfListPlatforms)
        std::fprintf(stderr, "Detected %d OpenCL Platforms: \n", static_cast<int>(count));
    for (cl_uint index = 0; index < count; ++index) {
        PlatformNames names;
        if (!readPlatformNames(platforms[index], names))
            return false;
        if (sfListPlatforms)
            std::fprintf(stderr, " %d: %s. %s. %s.\n", static_cast<int>(index),
                         names.vendor.asChar(), names.name.asChar(), names.version.asChar());
        Tstring supported;
        if (!readPlatformText(platforms[index], CL_PLATFORM_EXTENSIONS, supported))
            return false;
        if (sfListPlatforms)
            std::fprintf(stderr, " Supported extensions: %s \n", supported.asChar());

        // The first match is chosen; later platforms of the vendor are only listed.
        if (platform || !(names.vendor == vendor))
            continue;
        if (sfListPlatforms)
            std::fprintf(stderr, " Selected matching OpenCL Platform: %s %s %s.\n",
                         names.vendor.asChar(), names.name.asChar(), names.version.asChar());
        extensions = supported;
        platform = platforms[index];
    }
    sfListPlatforms = false;
    return platform != nullptr;
}
