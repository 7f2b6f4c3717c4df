#include "tools/info/rules/Verdicts.h"

#include "tools/info/rules/StartUpFailure.h"
#include "tools/info/text/StatusCodes.h"
#include "tools/info/text/TextFormatting.h"

namespace info {

std::string platformRejection(const Diagnostics& diagnostics, const Platform& platform)
{
    if (platform.chosen)
        return "";
    if (!diagnostics.startUp.attempted)
        return "there is no renderer, so start-up was not attempted";
    if (platform.status != CL_SUCCESS)
        return "a query failed with " + describeStatus(platform.status);
    if (!diagnostics.wantedVendor)
        return "there is no vendor to look for";
    if (platform.vendor != *diagnostics.wantedVendor)
        return "its vendor is not " + quoted(*diagnostics.wantedVendor);
    return chosenPlatform(diagnostics) ? "another platform of the same vendor comes first"
                                       : "start-up stopped before it searched for a platform";
}

std::string deviceRejection(const Diagnostics& diagnostics, const Platform& platform,
                            const Device& device)
{
    if (device.chosen) {
        const std::optional<StartUpFailure> failure = findStartUpFailure(diagnostics);
        return failure ? stepText(failure->step).failure : "";
    }
    if (!platform.chosen)
        return "its platform was not accepted";
    if (!diagnostics.renderer.usable)
        return "there is no renderer to share with";
    if (platform.sharingStatus != CL_SUCCESS)
        return "the query for the devices of the OpenGL context failed with " +
               describeStatus(platform.sharingStatus);
    if (!device.sharesWithRenderer)
        return "it does not share buffers with the renderer's OpenGL context";
    if (device.type != CL_DEVICE_TYPE_GPU)
        return "its type is not GPU alone (" + deviceTypeName(device.type) + ")";
    return "another GPU that shares with the renderer comes first";
}

std::string rendererDeviceMismatch(const Diagnostics& diagnostics)
{
    const Device* device = chosenDevice(diagnostics);
    if (!device || !diagnostics.renderer.usable)
        return "";
    const std::string pair = "OpenGL draws with " + diagnostics.renderer.renderer +
                             ", OpenCL computes on " + device->name;
    if (!diagnostics.renderer.adapterVendorId)
        return pair + "; no GPU vendor can be derived from OpenGL's texts, so it draws in software "
                      "or with an unknown GPU";
    if (device->vendorId && *device->vendorId != *diagnostics.renderer.adapterVendorId) {
        return pair + "; the two are of different vendors (ids " +
               hex(*diagnostics.renderer.adapterVendorId) + " and " + hex(*device->vendorId) +
               "), so every shared buffer crosses from one to the other, if it can be shared at "
               "all";
    }
    if (!device->drivesRenderer)
        return pair +
               "; the runtime does not report it as the device that drives the OpenGL context";
    return "";
}

} // namespace info
