#include "tools/info/rules/Decisions.h"

#include "tools/info/rules/DriverRules.h"
#include "tools/info/rules/StartUpFailure.h"
#include "tools/info/rules/SyncDecisions.h"
#include "tools/info/text/TextFormatting.h"

#include "runtime/EnvironmentVariables.h"

#include <optional>

namespace info {
namespace {

Decision decidePlatform(const Diagnostics& diagnostics, const Platform& platform)
{
    Decision decision{"platform", "Platform", platform.name + " of " + platform.vendor, "", ""};
    if (diagnostics.environment.platformWasChosen) {
        decision.reason = "no GPU vendor can be derived from the renderer, and this platform alone "
                          "shares with OpenGL";
    } else if (diagnostics.environment.find(kPlatformVariable)) {
        decision.reason = diagnostics.environment.platformFromOption
                              ? "--platform names its vendor"
                              : "VYRA_OPENCL_PLATFORM names its vendor";
        decision.variable = kPlatformVariable;
    } else {
        const bool fromRenderer =
            diagnostics.renderer.adapterVendorId == diagnostics.startUp.vendorId;
        decision.reason = "its vendor belongs to the vendor id " +
                          hex(diagnostics.startUp.vendorId) +
                          (fromRenderer ? " of the GPU that draws" : " given with --device-vendor");
    }
    return decision;
}

Decision decideDevice(const Device& device)
{
    return {"device", "Device", device.name,
            device.drivesRenderer ? "it drives the OpenGL context, and it is a GPU"
                                  : "it is the first GPU that shares with the OpenGL context",
            ""};
}

Decision decideDriver(const Diagnostics& diagnostics, const Device& device)
{
    Decision decision{"driver", "Driver", "accepted (" + device.driverVersion + ")", "", ""};
    if (diagnostics.startUp.provider != kNVIDIAProvider) {
        decision.reason = "rules exist for NVIDIA's drivers only";
        return decision;
    }
    const std::optional<DriverVerdict> verdict = judgeChosenDriver(diagnostics, std::nullopt);
    if (!verdict) {
        decision.reason = "its version does not have the form of NVIDIA's versions";
    } else if (verdict->usable) {
        decision.reason = "it is outside the range 361.92 to 368.85, whose OpenCL fails";
    } else {
        decision.reason = "it is in the range 361.92 to 368.85, whose OpenCL fails, and "
                          "VYRA_OPENCL_IGNORE_DRIVER_VERSION accepts it";
        decision.variable = kIgnoreDriverVersionVariable;
    }
    return decision;
}

Decision decideReadback(const Diagnostics& diagnostics)
{
    Decision decision{"async-readback", "Asynchronous read-back",
                      yesOrNo(diagnostics.startUp.asyncReadback), "", ""};
    switch (diagnostics.startUp.provider) {
    case kNVIDIAProvider:
        decision.reason = "NVIDIA's drivers have it from 359.91 on";
        break;
    case kAMDProvider:
    case kIntelProvider:
        decision.reason = "all drivers of this vendor have it";
        break;
    default:
        decision.reason = "only drivers of NVIDIA, AMD and Intel are known to have it";
    }
    return decision;
}

Decision decideDoublePrecision(const Diagnostics& diagnostics, const Platform& platform)
{
    const bool supported = diagnostics.startUp.doublePrecision;
    const bool old =
        platform.version.starts_with("OpenCL 1.0") || platform.version.starts_with("OpenCL 1.1");
    const std::string verb = supported ? "lists" : "does not list";
    return {"double-precision", "Double precision", yesOrNo(supported),
            old ? "the platform (" + platform.version.substr(0, 10) + ") " + verb + " cl_khr_fp64"
                : std::string("the device reports that it ") +
                      (supported ? "supports" : "does not support") + " it",
            ""};
}

Decision decideMinimumVertices(const Diagnostics& diagnostics)
{
    Decision decision{"minimum-vertices", "Minimum vertices of a mesh",
                      std::to_string(diagnostics.startUp.minimumVertices), "", ""};
    if (diagnostics.environment.find(kMinimumVerticesVariable)) {
        decision.reason = std::string(kMinimumVerticesVariable) + " sets it";
        decision.variable = kMinimumVerticesVariable;
    } else {
        decision.reason = diagnostics.startUp.provider == kNVIDIAProvider
                              ? "it is the default with NVIDIA"
                              : "it is the default";
    }
    return decision;
}

} // namespace

std::vector<Decision> explainDecisions(const Diagnostics& diagnostics)
{
    const std::optional<StartUpFailure> failure = findStartUpFailure(diagnostics);
    const auto passed = [&](StartUpStep step) { return !failure || failure->step > step; };
    std::vector<Decision> decisions;
    const Platform* platform = chosenPlatform(diagnostics);
    if (!platform || !passed(StartUpStep::kPlatform))
        return decisions;
    decisions.push_back(decidePlatform(diagnostics, *platform));
    decisions.push_back(decideMinimumVertices(diagnostics));
    decisions.push_back(decideBatching(diagnostics));
    decisions.push_back(decideThreadedSharing(diagnostics));
    const Device* device = chosenDevice(diagnostics);
    if (!device)
        return decisions;
    decisions.push_back(decideDevice(*device));
    if (passed(StartUpStep::kDriver)) {
        decisions.push_back(decideDriver(diagnostics, *device));
        decisions.push_back(decideReadback(diagnostics));
    }
    if (passed(StartUpStep::kContext)) {
        decisions.push_back(decideGraphicsToCL(diagnostics));
        decisions.push_back(decideCLToGraphics(diagnostics));
    }
    if (passed(StartUpStep::kAvailability) &&
        !(failure && failure->status && failure->step == StartUpStep::kDoublePrecision))
        decisions.push_back(decideDoublePrecision(diagnostics, *platform));
    return decisions;
}

} // namespace info
