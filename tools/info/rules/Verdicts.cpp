#include "tools/info/rules/Verdicts.h"

#include "tools/info/rules/StartUpFailure.h"
#include "tools/info/text/StatusCodes.h"
#include "tools/info/text/TextFormatting.h"

namespace info {

std::string platformRejection(const Facts& facts, const Platform& platform)
{
    if (platform.chosen)
        return "";
    if (!facts.startUp.attempted)
        return "there is no renderer, so start-up looks for none";
    if (platform.status != CL_SUCCESS)
        return "a question about it failed with " + describeStatus(platform.status);
    if (!facts.wantedVendor)
        return "there is no vendor to look for";
    if (platform.vendor != *facts.wantedVendor)
        return "its vendor is not " + quoted(*facts.wantedVendor);
    return chosenPlatform(facts) ? "another platform of the same vendor comes first"
                                 : "start-up stopped before it looked for a platform";
}

std::string deviceRejection(const Facts& facts, const Platform& platform, const Device& device)
{
    if (device.chosen) {
        const std::optional<Stop> stop = findStop(facts);
        return stop ? stepName(stop->step).failure : "";
    }
    if (!platform.chosen)
        return "its platform was not accepted";
    if (!facts.renderer.usable)
        return "there is no renderer to share with";
    if (platform.sharingStatus != CL_SUCCESS)
        return "the question for the devices of the OpenGL context failed with " +
               describeStatus(platform.sharingStatus);
    if (!device.sharesWithRenderer)
        return "it does not share buffers with the renderer's OpenGL context";
    if (device.type != CL_DEVICE_TYPE_GPU)
        return "it is not a GPU and nothing else (" + deviceTypeName(device.type) + ")";
    return "another GPU that shares with the renderer comes first";
}

std::string rendererBesideDevice(const Facts& facts)
{
    const Device* device = chosenDevice(facts);
    if (!device || !facts.renderer.usable)
        return "";
    const std::string pair =
        "OpenGL draws with " + facts.renderer.renderer + ", OpenCL computes on " + device->name;
    if (!facts.renderer.adapterVendorId)
        return pair +
               "; no GPU vendor follows from OpenGL's texts, so it draws in software or with "
               "an unknown GPU";
    if (device->vendorId && *device->vendorId != *facts.renderer.adapterVendorId)
        return pair + "; the two are of different makers (vendor ids " +
               hex(*facts.renderer.adapterVendorId) + " and " + hex(*device->vendorId) +
               "), so every shared buffer crosses from one to the other, if it can be shared at "
               "all";
    if (!device->drivesRenderer)
        return pair + "; the runtime does not name it as the device that drives the OpenGL context";
    return "";
}

} // namespace info
