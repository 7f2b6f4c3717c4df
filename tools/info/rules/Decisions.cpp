#include "tools/info/rules/Decisions.h"

#include "tools/info/rules/DriverRules.h"
#include "tools/info/rules/StartUpFailure.h"
#include "tools/info/rules/SyncDecisions.h"
#include "tools/info/text/TextFormatting.h"

#include <optional>

namespace info {
namespace {

Decision decidePlatform(const Facts& facts, const Platform& platform)
{
    Decision decision{"platform", "Platform", platform.name + " of " + platform.vendor, "", ""};
    if (facts.environment.platformWasChosen) {
        decision.reason = "no GPU vendor follows from the renderer, and this platform alone shares "
                          "with OpenGL";
    } else if (facts.environment.find("VYRA_OPENCL_PLATFORM")) {
        decision.reason = facts.environment.platformFromOption
                              ? "--platform names its vendor"
                              : "VYRA_OPENCL_PLATFORM names its vendor";
        decision.variable = "VYRA_OPENCL_PLATFORM";
    } else {
        const bool fromRenderer = facts.renderer.adapterVendorId == facts.startUp.vendorId;
        decision.reason = "its vendor goes with the vendor id " + hex(facts.startUp.vendorId) +
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

Decision decideDriver(const Facts& facts, const Device& device)
{
    Decision decision{"driver", "Driver", "accepted (" + device.driverVersion + ")", "", ""};
    if (facts.startUp.provider != kNVIDIAProvider) {
        decision.reason = "rules exist for NVIDIA's drivers only";
        return decision;
    }
    const std::optional<DriverVerdict> verdict = judgeChosenDriver(facts, std::nullopt);
    if (!verdict) {
        decision.reason = "its version cannot be read as NVIDIA writes it";
    } else if (verdict->usable) {
        decision.reason = "it is outside the range 361.92 to 368.85, whose OpenCL fails";
    } else {
        decision.reason = "it is in the range 361.92 to 368.85, whose OpenCL fails, and "
                          "VYRA_OPENCL_IGNORE_DRIVER_VERSION accepts it";
        decision.variable = "VYRA_OPENCL_IGNORE_DRIVER_VERSION";
    }
    return decision;
}

Decision decideReadback(const Facts& facts)
{
    Decision decision{"async-readback", "Asynchronous read-back",
                      yesOrNo(facts.startUp.asyncReadback), "", ""};
    switch (facts.startUp.provider) {
    case kNVIDIAProvider:
        decision.reason = "NVIDIA's drivers have it from 359.91 on";
        break;
    case kAMDProvider:
    case kIntelProvider:
        decision.reason = "all drivers of this vendor have it";
        break;
    default:
        decision.reason = "only drivers of NVIDIA, AMD and Intel are trusted with it";
    }
    return decision;
}

Decision decideDoublePrecision(const Facts& facts, const Platform& platform)
{
    const bool supported = facts.startUp.doublePrecision;
    const bool old =
        platform.version.starts_with("OpenCL 1.0") || platform.version.starts_with("OpenCL 1.1");
    const std::string verb = supported ? "lists" : "does not list";
    return {"double-precision", "Double precision", yesOrNo(supported),
            old ? "the platform (" + platform.version.substr(0, 10) + ") " + verb + " cl_khr_fp64"
                : std::string("the device reports that it ") +
                      (supported ? "computes" : "cannot compute") + " with it",
            ""};
}

Decision decideMinimumVertices(const Facts& facts)
{
    constexpr char kVariable[] = "VYRA_OPENCL_DEFORMER_MIN_VERTS";
    Decision decision{"minimum-vertices", "Vertices that a mesh needs",
                      std::to_string(facts.startUp.minimumVertices), "", ""};
    if (facts.environment.find(kVariable)) {
        decision.reason = std::string(kVariable) + " sets it";
        decision.variable = kVariable;
    } else {
        decision.reason = facts.startUp.provider == kNVIDIAProvider
                              ? "it is the default with NVIDIA"
                              : "it is the default";
    }
    return decision;
}

} // namespace

std::vector<Decision> explainDecisions(const Facts& facts)
{
    const std::optional<Stop> stop = findStop(facts);
    const auto passed = [&stop](Step step) { return !stop || stop->step > step; };
    std::vector<Decision> decisions;
    const Platform* platform = chosenPlatform(facts);
    if (!platform || !passed(Step::kPlatform))
        return decisions;
    decisions.push_back(decidePlatform(facts, *platform));
    decisions.push_back(decideMinimumVertices(facts));
    decisions.push_back(decideBatching(facts));
    decisions.push_back(decideThreadedSharing(facts));
    const Device* device = chosenDevice(facts);
    if (!device)
        return decisions;
    decisions.push_back(decideDevice(*device));
    if (passed(Step::kDriver)) {
        decisions.push_back(decideDriver(facts, *device));
        decisions.push_back(decideReadback(facts));
    }
    if (passed(Step::kContext)) {
        decisions.push_back(decideGraphicsToCL(facts));
        decisions.push_back(decideCLToGraphics(facts));
    }
    if (passed(Step::kAvailability) &&
        !(stop && stop->status && stop->step == Step::kDoublePrecision))
        decisions.push_back(decideDoublePrecision(facts, *platform));
    return decisions;
}

} // namespace info
