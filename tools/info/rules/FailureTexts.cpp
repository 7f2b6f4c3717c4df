#include "tools/info/rules/FailureTexts.h"

#include "tools/info/text/NearestName.h"
#include "tools/info/text/TextFormatting.h"

#include "runtime/EnvironmentVariables.h"

#include <algorithm>

namespace info {
namespace {

constexpr char kUseSharingDriver[] =
    "Use a GPU whose OpenCL driver lists cl_khr_gl_sharing and draw on that same GPU. On a machine "
    "without one, "
#if defined(_WIN32)
    "copy glshare's OpenCL.dll to the folder of the program; it shares in software.";
#else
    "set OPENCL_LAYERS to the path of libglshare.so, which shares in software.";
#endif
constexpr char kInstallDriver[] =
    "Install the OpenCL driver of the GPU that draws the window; on a machine without a GPU, a "
    "driver for the CPU (on Debian: pocl-opencl-icd).";
constexpr char kDriverProblem[] =
    "This is a problem of the OpenCL driver: update it, and close other programs that use the GPU.";

constexpr char kPoclVendor[] = "The pocl project";

std::vector<std::string> vendorsOf(const Diagnostics& diagnostics)
{
    std::vector<std::string> vendors;
    for (const Platform& platform : diagnostics.platforms) {
        if (std::find(vendors.begin(), vendors.end(), platform.vendor) == vendors.end())
            vendors.push_back(platform.vendor);
    }
    return vendors;
}

void explainRenderer(const Diagnostics& diagnostics, StartUpFailure& failure)
{
    failure.reason =
        "There is no OpenGL to share buffers with: " + diagnostics.renderer.problem + ".";
    failure.remedy =
        "Run this where the host application draws. Without a display, use a virtual one: "
        "xvfb-run -a vyra-opencl-info.";
}

void explainSwitch(const Diagnostics& diagnostics, StartUpFailure& failure)
{
    const std::string* value = diagnostics.environment.find(kDisableOpenCLVariable);
    failure.reason = "VYRA_DISABLE_OPENCL is set (to " + quoted(value ? *value : "") +
                     "). Its presence alone switches OpenCL off, whatever its value.";
    failure.remedy = "Remove the variable: unset VYRA_DISABLE_OPENCL.";
}

void explainLoader(const Diagnostics& diagnostics, StartUpFailure& failure)
{
    const Loader& loader = diagnostics.loader;
    if (!loader.missingCore.empty()) {
        failure.reason =
            "The OpenCL library " + loader.file +
            " lacks functions that every OpenCL has: " + commaList(loader.missingCore) + ".";
        failure.remedy =
            "Replace it with a complete OpenCL loader (on Debian: ocl-icd-libopencl1).";
        return;
    }
    failure.reason = "The OpenCL library cannot be opened: " + loader.problem + ".";
    failure.remedy =
        std::string("Install an OpenCL loader (on Debian: ocl-icd-libopencl1). ") + kInstallDriver;
}

void explainVendor(const Diagnostics& diagnostics, StartUpFailure& failure)
{
    failure.reason =
        "No platform belongs to the vendor id " + hex(diagnostics.startUp.vendorId) +
        ". OpenGL draws with " + quoted(diagnostics.renderer.renderer) +
        (diagnostics.renderer.adapterVendorId
             ? "."
             : ", from which no GPU vendor can be derived: software, or an unknown GPU.");
    const std::vector<std::string> vendors = vendorsOf(diagnostics);
    const bool anyShares = std::any_of(
        diagnostics.platforms.begin(), diagnostics.platforms.end(), [](const Platform& platform) {
            return listsExtension(platform.extensions, "cl_khr_gl_sharing");
        });
    failure.remedy =
        diagnostics.startUp.vendorId == 0 && !anyShares
            ? kUseSharingDriver
            : "Name the vendor of a platform of this machine with VYRA_OPENCL_PLATFORM or "
              "--platform: " +
                  quotedList(vendors) + ".";
}

void explainPlatformByName(const std::vector<std::string>& vendors, const std::string& wanted,
                           StartUpFailure& failure)
{
    const std::string* nearest = nearestName(wanted, vendors);
    failure.remedy = "Set VYRA_OPENCL_PLATFORM to the vendor exactly as the platform spells it: " +
                     quotedList(vendors) + ".";
    if (nearest)
        failure.remedy += " Probably " + quoted(*nearest) + " is meant.";
}

void explainPlatform(const Diagnostics& diagnostics, StartUpFailure& failure)
{
    const std::vector<std::string> vendors = vendorsOf(diagnostics);
    if (vendors.empty()) {
        failure.reason = "This machine has no OpenCL platform: the loader found no driver.";
        failure.remedy = kInstallDriver;
        return;
    }
    const std::string wanted = diagnostics.wantedVendor.value_or("");
    failure.reason = "No platform has the vendor " + quoted(wanted) + "; this machine has " +
                     quotedList(vendors) + ".";
    if (diagnostics.environment.find(kPlatformVariable)) {
        explainPlatformByName(vendors, wanted, failure);
        return;
    }
    const bool fromRenderer = diagnostics.renderer.adapterVendorId == diagnostics.startUp.vendorId;
    failure.reason += " That vendor belongs to the vendor id " + hex(diagnostics.startUp.vendorId) +
                      (fromRenderer ? ", that of the GPU that draws the window ("
                                    : ", given with --device-vendor (OpenGL draws with ") +
                      diagnostics.renderer.renderer + ").";
    failure.remedy =
        "Install that vendor's OpenCL driver. On a machine with two GPUs, make the host "
        "draw on the one that has OpenCL (with NVIDIA's: __NV_PRIME_RENDER_OFFLOAD=1 "
        "__GLX_VENDOR_LIBRARY_NAME=nvidia).";
}

// Describes the devices that share with the renderer's context.
std::string sharingDevices(const Platform& platform)
{
    std::vector<std::string> devices;
    for (const Device& device : platform.devices) {
        if (device.sharesWithRenderer)
            devices.push_back(device.name + " (" + deviceTypeName(device.type) + ")");
    }
    if (devices.empty())
        return "None of its devices shares buffers with the renderer's OpenGL context.";
    return "The only devices that share with the renderer are not GPUs: " + commaList(devices) +
           ".";
}

void explainNoDevices(const Platform& platform, StartUpFailure& failure)
{
    failure.reason = "The platform " + quoted(platform.name) + " of " + quoted(platform.vendor) +
                     " has 0 devices.";
    failure.remedy =
        platform.vendor == kPoclVendor
            ? "PoCL has no devices if it cannot write its cache: set POCL_CACHE_DIR, or "
              "HOME, to a directory that can be written."
            : "Check the platform's driver, and the permissions of the device files.";
}

void explainDevice(const Diagnostics& diagnostics, StartUpFailure& failure)
{
    failure.remedy = kUseSharingDriver;
    const Platform* platform = chosenPlatform(diagnostics);
    if (!platform) {
        failure.reason = "No device was found.";
        return;
    }
    if (platform->devices.empty()) {
        explainNoDevices(*platform, failure);
        return;
    }
    const std::string where = "On the platform " + quoted(platform->name) + " of " +
                              quoted(platform->vendor) + " no GPU shares buffers with OpenGL. ";
    if (!diagnostics.loader.missingSharing.empty())
        failure.reason =
            where + "The runtime lacks " + commaList(diagnostics.loader.missingSharing) + ".";
    else if (failure.status)
        failure.reason = where + "The query for the devices of the OpenGL context failed.";
    else
        failure.reason = where + sharingDevices(*platform);
    if (!listsExtension(platform->extensions, "cl_khr_gl_sharing"))
        failure.reason += " The platform does not list cl_khr_gl_sharing.";
}

void explainDriver(const Diagnostics& diagnostics, StartUpFailure& failure)
{
    const Device* device = chosenDevice(diagnostics);
    if (failure.status) {
        failure.reason = "The query for the driver's version failed.";
        failure.remedy = kDriverProblem;
        return;
    }
    failure.reason = "The NVIDIA driver " + (device ? device->driverVersion : "") +
                     " is one of those from 361.92 to 368.85, whose OpenCL fails.";
    failure.remedy = "Install another driver. VYRA_OPENCL_IGNORE_DRIVER_VERSION=1 uses it anyway.";
}

void explainContext(const Diagnostics& diagnostics, StartUpFailure& failure)
{
    const Device* device = chosenDevice(diagnostics);
    failure.reason = "No context that shares with OpenGL can be created on " +
                     (device ? device->name : "the device") + ".";
    failure.remedy = kDriverProblem;
}

void explainSharingFunctions(const Diagnostics& diagnostics, StartUpFailure& failure)
{
    failure.reason = "The runtime lacks functions for shared buffers: " +
                     commaList(diagnostics.loader.missingSharing) + ".";
    failure.remedy = kUseSharingDriver;
}

void explainAvailability(const Diagnostics&, StartUpFailure& failure)
{
    failure.reason = failure.status ? "A query of the device failed."
                                    : "The device reports that it is not available.";
    failure.remedy = kDriverProblem;
}

void explainDoublePrecision(const Diagnostics& diagnostics, StartUpFailure& failure)
{
    if (failure.status) {
        failure.reason = "The query for the device's double precision failed.";
        failure.remedy = kDriverProblem;
        return;
    }
    const std::string* value = diagnostics.environment.find(kOffWithoutDoubleVariable);
    failure.reason =
        "The device has no double precision, and VYRA_OPENCL_OFF_WITHOUT_DOUBLE_SUPPORT=" +
        (value ? *value : "") + " requires it.";
    failure.remedy = "Remove the variable to compute in single precision, or use another device.";
}

void explainQueue(const Diagnostics&, StartUpFailure& failure)
{
    failure.reason = "No command queue can be created on the device.";
    failure.remedy = kDriverProblem;
}

struct StepExplanation {
    StartUpStep step;
    void (*explain)(const Diagnostics& diagnostics, StartUpFailure& failure);
};

constexpr StepExplanation kExplanations[] = {
    {StartUpStep::kNotStarted, explainRenderer},
    {StartUpStep::kSwitch, explainSwitch},
    {StartUpStep::kLoader, explainLoader},
    {StartUpStep::kVendor, explainVendor},
    {StartUpStep::kPlatform, explainPlatform},
    {StartUpStep::kDevice, explainDevice},
    {StartUpStep::kDriver, explainDriver},
    {StartUpStep::kContext, explainContext},
    {StartUpStep::kSharingFunctions, explainSharingFunctions},
    {StartUpStep::kAvailability, explainAvailability},
    {StartUpStep::kDoublePrecision, explainDoublePrecision},
    {StartUpStep::kQueue, explainQueue},
};

} // namespace

void explainFailure(const Diagnostics& diagnostics, StartUpFailure& failure)
{
    for (const StepExplanation& explanation : kExplanations) {
        if (explanation.step == failure.step)
            explanation.explain(diagnostics, failure);
    }
    const std::vector<std::string>& layers = diagnostics.loader.missingLayers;
    if (layers.empty() || failure.step == StartUpStep::kNotStarted)
        return;
    failure.reason =
        "OPENCL_LAYERS names " + quotedList(layers) + ", which is not a file. " + failure.reason;
    failure.remedy = "Correct OPENCL_LAYERS. " + failure.remedy;
}

} // namespace info
