#include "tools/info/rules/FailureTexts.h"

#include "tools/info/text/NearestName.h"
#include "tools/info/text/TextFormatting.h"

#include <algorithm>

namespace info {
namespace {

constexpr char kUseSharingDriver[] =
    "Use a GPU whose OpenCL driver lists cl_khr_gl_sharing and draw on that same GPU. On a machine "
    "without one, set OPENCL_LAYERS to the path of libglshare.so, which shares in software.";
constexpr char kInstallDriver[] =
    "Install the OpenCL driver of the GPU that draws the window; on a machine without a GPU, a "
    "driver for the processor (on Debian: pocl-opencl-icd).";
constexpr char kDriverProblem[] =
    "This is a problem of the OpenCL driver: update it, and close other programs that use the GPU.";

constexpr char kPoclVendor[] = "The pocl project";

std::vector<std::string> vendorsOf(const Facts& facts)
{
    std::vector<std::string> vendors;
    for (const Platform& platform : facts.platforms) {
        if (std::find(vendors.begin(), vendors.end(), platform.vendor) == vendors.end())
            vendors.push_back(platform.vendor);
    }
    return vendors;
}

void explainRenderer(const Facts& facts, Stop& stop)
{
    stop.reason = "There is no OpenGL to share buffers with: " + facts.renderer.problem + ".";
    stop.remedy =
        "Run this where the host application draws. Without a display, use a virtual one: "
        "xvfb-run -a vyra-opencl-info.";
}

void explainSwitch(const Facts& facts, Stop& stop)
{
    const std::string* value = facts.environment.find("VYRA_DISABLE_OPENCL");
    stop.reason = "VYRA_DISABLE_OPENCL is set (to " + quoted(value ? *value : "") +
                  "). Its presence alone switches OpenCL off, whatever its value.";
    stop.remedy = "Remove the variable: unset VYRA_DISABLE_OPENCL.";
}

void explainLoader(const Facts& facts, Stop& stop)
{
    const Loader& loader = facts.loader;
    if (!loader.missingCore.empty()) {
        stop.reason = "The OpenCL library " + loader.file +
                      " lacks functions that every OpenCL has: " + commaList(loader.missingCore) +
                      ".";
        stop.remedy = "Replace it with a complete OpenCL loader (on Debian: ocl-icd-libopencl1).";
        return;
    }
    stop.reason = "The OpenCL library cannot be opened: " + loader.problem + ".";
    stop.remedy =
        std::string("Install an OpenCL loader (on Debian: ocl-icd-libopencl1). ") + kInstallDriver;
}

void explainVendor(const Facts& facts, Stop& stop)
{
    stop.reason = "No platform goes with the vendor id " + hex(facts.startUp.vendorId) +
                  ". OpenGL draws with " + quoted(facts.renderer.renderer) +
                  (facts.renderer.adapterVendorId
                       ? "."
                       : ", from which no GPU vendor follows: software, or an unknown GPU.");
    const std::vector<std::string> vendors = vendorsOf(facts);
    const bool anyShares =
        std::any_of(facts.platforms.begin(), facts.platforms.end(), [](const Platform& platform) {
            return listsExtension(platform.extensions, "cl_khr_gl_sharing");
        });
    stop.remedy =
        facts.startUp.vendorId == 0 && !anyShares
            ? kUseSharingDriver
            : "Name the vendor of a platform of this machine with VYRA_OPENCL_PLATFORM or "
              "--platform: " +
                  quotedList(vendors) + ".";
}

void explainPlatformByName(const std::vector<std::string>& vendors, const std::string& wanted,
                           Stop& stop)
{
    const std::string* nearest = nearestName(wanted, vendors);
    stop.remedy = "Set VYRA_OPENCL_PLATFORM to the vendor exactly as the platform spells it: " +
                  quotedList(vendors) + ".";
    if (nearest)
        stop.remedy += " Probably " + quoted(*nearest) + " is meant.";
}

void explainPlatform(const Facts& facts, Stop& stop)
{
    const std::vector<std::string> vendors = vendorsOf(facts);
    if (vendors.empty()) {
        stop.reason = "This machine has no OpenCL platform: the loader found no driver.";
        stop.remedy = kInstallDriver;
        return;
    }
    const std::string wanted = facts.wantedVendor.value_or("");
    stop.reason =
        "No platform has the vendor " + quoted(wanted) + "; there is " + quotedList(vendors) + ".";
    if (facts.environment.find("VYRA_OPENCL_PLATFORM")) {
        explainPlatformByName(vendors, wanted, stop);
        return;
    }
    const bool fromRenderer = facts.renderer.adapterVendorId == facts.startUp.vendorId;
    stop.reason += " That vendor goes with the vendor id " + hex(facts.startUp.vendorId) +
                   (fromRenderer ? ", that of the GPU that draws the window ("
                                 : ", given with --device-vendor (OpenGL draws with ") +
                   facts.renderer.renderer + ").";
    stop.remedy = "Install that vendor's OpenCL driver. On a machine with two GPUs, make the host "
                  "draw on the one that has OpenCL (with NVIDIA's: __NV_PRIME_RENDER_OFFLOAD=1 "
                  "__GLX_VENDOR_LIBRARY_NAME=nvidia).";
}

// The devices that the renderer's context shares with, or why there are none.
std::string sharingDevices(const Platform& platform)
{
    std::vector<std::string> devices;
    for (const Device& device : platform.devices) {
        if (device.sharesWithRenderer)
            devices.push_back(device.name + " (" + deviceTypeName(device.type) + ")");
    }
    if (devices.empty())
        return "None of its devices shares buffers with the renderer's OpenGL context.";
    return "The only devices that share with the renderer are no GPUs: " + commaList(devices) + ".";
}

void explainNoDevices(const Platform& platform, Stop& stop)
{
    stop.reason = "The platform " + quoted(platform.name) + " of " + quoted(platform.vendor) +
                  " has 0 devices.";
    stop.remedy = platform.vendor == kPoclVendor
                      ? "PoCL has no devices if it cannot write its cache: set POCL_CACHE_DIR, or "
                        "HOME, to a folder that can be written."
                      : "Check the platform's driver, and the permissions of the device files.";
}

void explainDevice(const Facts& facts, Stop& stop)
{
    stop.remedy = kUseSharingDriver;
    const Platform* platform = chosenPlatform(facts);
    if (!platform) {
        stop.reason = "No device was found.";
        return;
    }
    if (platform->devices.empty()) {
        explainNoDevices(*platform, stop);
        return;
    }
    const std::string where = "On the platform " + quoted(platform->name) + " of " +
                              quoted(platform->vendor) + " no GPU shares buffers with OpenGL. ";
    if (!facts.loader.missingSharing.empty())
        stop.reason = where + "The runtime lacks " + commaList(facts.loader.missingSharing) + ".";
    else if (stop.status)
        stop.reason = where + "The runtime was asked for the devices of the OpenGL context.";
    else
        stop.reason = where + sharingDevices(*platform);
    if (!listsExtension(platform->extensions, "cl_khr_gl_sharing"))
        stop.reason += " The platform does not list cl_khr_gl_sharing.";
}

void explainDriver(const Facts& facts, Stop& stop)
{
    const Device* device = chosenDevice(facts);
    if (stop.status) {
        stop.reason = "The driver does not tell its version.";
        stop.remedy = kDriverProblem;
        return;
    }
    stop.reason = "The NVIDIA driver " + (device ? device->driverVersion : "") +
                  " is one of those from 361.92 to 368.85, whose OpenCL fails.";
    stop.remedy =
        "Install another driver. VYRA_OPENCL_IGNORE_DRIVER_VERSION=1 uses it all the same.";
}

void explainContext(const Facts& facts, Stop& stop)
{
    const Device* device = chosenDevice(facts);
    stop.reason = "No context that shares with OpenGL can be made on " +
                  (device ? device->name : "the device") + ".";
    stop.remedy = kDriverProblem;
}

void explainSharingFunctions(const Facts& facts, Stop& stop)
{
    stop.reason = "The runtime lacks functions for shared buffers: " +
                  commaList(facts.loader.missingSharing) + ".";
    stop.remedy = kUseSharingDriver;
}

void explainAvailability(const Facts&, Stop& stop)
{
    stop.reason = stop.status ? "The device does not answer a question about itself."
                              : "The device says that it is not available.";
    stop.remedy = kDriverProblem;
}

void explainDoublePrecision(const Facts& facts, Stop& stop)
{
    if (stop.status) {
        stop.reason = "The device does not tell whether it computes in double precision.";
        stop.remedy = kDriverProblem;
        return;
    }
    const std::string* value = facts.environment.find("VYRA_OPENCL_OFF_WITHOUT_DOUBLE_SUPPORT");
    stop.reason =
        "The device has no double precision, and VYRA_OPENCL_OFF_WITHOUT_DOUBLE_SUPPORT=" +
        (value ? *value : "") + " demands it.";
    stop.remedy = "Remove the variable to compute in single precision, or use another device.";
}

void explainQueue(const Facts&, Stop& stop)
{
    stop.reason = "The device gives no command queue.";
    stop.remedy = kDriverProblem;
}

// In the order of Step.
constexpr void (*kExplanations[])(const Facts&, Stop&) = {
    explainRenderer,         explainSwitch,       explainLoader,          explainVendor,
    explainPlatform,         explainDevice,       explainDriver,          explainContext,
    explainSharingFunctions, explainAvailability, explainDoublePrecision, explainQueue,
};

} // namespace

void explainStop(const Facts& facts, Stop& stop)
{
    kExplanations[static_cast<std::size_t>(stop.step)](facts, stop);
    const std::vector<std::string>& layers = facts.loader.missingLayers;
    if (layers.empty() || stop.step == Step::kRenderer)
        return;
    stop.reason =
        "OPENCL_LAYERS names " + quotedList(layers) + ", which is not a file. " + stop.reason;
    stop.remedy = "Correct OPENCL_LAYERS. " + stop.remedy;
}

} // namespace info
