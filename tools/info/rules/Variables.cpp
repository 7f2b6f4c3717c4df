#include "tools/info/rules/Variables.h"

#include "tools/info/rules/Decisions.h"
#include "tools/info/rules/DriverRules.h"
#include "tools/info/rules/StartUpFailure.h"
#include "tools/info/rules/SyncDecisions.h"
#include "tools/info/text/NearestName.h"
#include "tools/info/text/TextFormatting.h"

#include <algorithm>
#include <cctype>
#include <iterator>
#include <string_view>

namespace info {
namespace {

struct Finding {
    Effect effect;
    std::string explanation;
};

Finding changed(std::string explanation)
{
    return {Effect::kChanged, std::move(explanation)};
}

Finding withoutEffect(std::string explanation)
{
    return {Effect::kNone, std::move(explanation)};
}

Finding explainDisable(const Facts&)
{
    return changed("switched OpenCL off: its presence alone counts, whatever the value");
}

Finding explainPlatform(const Facts& facts)
{
    return changed("named the vendor of the platform to look for, in place of the vendor id " +
                   hex(facts.startUp.vendorId));
}

Finding explainMinimumVertices(const Facts& facts)
{
    return changed("set the number of vertices to " +
                   std::to_string(facts.startUp.minimumVertices) +
                   " (what is no number reads as 0, and so does a negative one)");
}

bool sameVerdict(const DriverVerdict& one, const DriverVerdict& other)
{
    return one.usable == other.usable && one.implicitSync == other.implicitSync;
}

Finding explainIgnoreDriver(const Facts& facts)
{
    if (facts.startUp.provider != kNVIDIAProvider)
        return withoutEffect("the platform is not NVIDIA's");
    const auto with = judgeChosenDriver(facts, facts.environment.ignoreDriverVersion);
    const auto without = judgeChosenDriver(facts, std::nullopt);
    if (!with || !without)
        return withoutEffect("the driver's version cannot be read");
    if (sameVerdict(*with, *without))
        return withoutEffect("the driver would be judged the same without it");
    return changed(with->usable == without->usable
                       ? "trusted the driver's implicit synchronisation"
                       : "accepted a driver of the range that is refused otherwise");
}

Finding explainDoubleDemand(const Facts& facts)
{
    if (facts.environment.doubleDemanded == 0)
        return withoutEffect("only a whole number other than 0 demands double precision");
    if (facts.startUp.doublePrecision)
        return withoutEffect("the device has double precision");
    return changed("switched OpenCL off, since the device has no double precision");
}

Finding explainForceFinish(const Facts& facts)
{
    if (facts.environment.syncModes.forceFinish == 0)
        return withoutEffect("only a whole number other than 0 forces finish calls");
    return changed("made both sides wait with finish calls");
}

// What became of a variable that forces a mode. Modes and wishes are the numbers of the modes.
Finding explainForcedMode(const Facts& facts, int wish, int highest, int mode, int automatic)
{
    if (facts.environment.syncModes.forceFinish != 0)
        return withoutEffect("VYRA_OPENCL_FORCE_FINISH goes before it");
    if (wish < 1 || wish > highest)
        return withoutEffect("only the whole numbers 1 to " + std::to_string(highest) +
                             " force a mode");
    if (mode != wish)
        return withoutEffect("this machine lacks the means for that mode; the library says so at "
                             "start-up");
    if (mode == automatic)
        return withoutEffect("the library chooses the same mode without it");
    return changed("forced this mode in place of mode " + std::to_string(automatic));
}

Finding explainGraphicsToCL(const Facts& facts)
{
    return explainForcedMode(facts, facts.environment.syncModes.graphicsToCL,
                             TopenCLInfo::kGraphicsToCLFinish, facts.startUp.graphicsToCL,
                             automaticGraphicsToCLMode(facts));
}

Finding explainCLToGraphics(const Facts& facts)
{
    return explainForcedMode(facts, facts.environment.syncModes.clToGraphics,
                             TopenCLInfo::kCLToGraphicsFinish, facts.startUp.clToGraphics,
                             automaticCLToGraphicsMode(facts));
}

Finding explainForceThreading(const Facts& facts)
{
    std::string text = "switched batching off: each buffer is acquired and released on its own";
    if (facts.startUp.provider == kNVIDIAProvider)
        text += "; sharing from several threads is reported";
    return changed(text);
}

struct KnownVariable {
    const char* name;
    Step readAt; // the step of start-up that reads it, or the one behind
    Finding (*explain)(const Facts&);
};

constexpr KnownVariable kKnownVariables[] = {
    {"VYRA_DISABLE_OPENCL", Step::kSwitch, explainDisable},
    {"VYRA_OPENCL_PLATFORM", Step::kVendor, explainPlatform},
    {"VYRA_OPENCL_DEFORMER_MIN_VERTS", Step::kDevice, explainMinimumVertices},
    {"VYRA_OPENCL_IGNORE_DRIVER_VERSION", Step::kDriver, explainIgnoreDriver},
    {"VYRA_OPENCL_FORCE_FINISH", Step::kSharingFunctions, explainForceFinish},
    {"VYRA_GRAPHICSTOOPENCL_SYNC_MODE", Step::kSharingFunctions, explainGraphicsToCL},
    {"VYRA_OPENCLTOGRAPHICS_SYNC_MODE", Step::kSharingFunctions, explainCLToGraphics},
    {"VYRA_OPENCL_OFF_WITHOUT_DOUBLE_SUPPORT", Step::kDoublePrecision, explainDoubleDemand},
    {"VYRA_OPENCL_FORCE_THREADING", Step::kSwitch, explainForceThreading},
};

const KnownVariable* findKnown(const std::string& name)
{
    for (const KnownVariable& known : kKnownVariables) {
        if (name == known.name)
            return &known;
    }
    return nullptr;
}

// What glshare reads; D3D11 only on Windows.
constexpr const char* kGlshareVariables[] = {"GLSHARE_GL_EVENT", "GLSHARE_CPU_AS_GPU",
                                             "GLSHARE_ZERO_COPY", "GLSHARE_D3D11"};

bool isKnownToGlshare(const std::string& name)
{
    return std::find(std::begin(kGlshareVariables), std::end(kGlshareVariables), name) !=
           std::end(kGlshareVariables);
}

// Whether the name begins with the upper-case prefix, in any case.
bool resembles(const std::string& name, std::string_view prefix)
{
    return name.size() >= prefix.size() &&
           std::equal(prefix.begin(), prefix.end(), name.begin(), [](char wanted, char found) {
               return std::toupper(static_cast<unsigned char>(found)) == wanted;
           });
}

VariableReport explainStranger(const Variable& variable, const char* owner)
{
    std::vector<std::string> names(std::begin(kGlshareVariables), std::end(kGlshareVariables));
    for (const KnownVariable& known : kKnownVariables)
        names.emplace_back(known.name);
    const std::string* nearest = nearestName(variable.name, names);
    return {variable.name, variable.value, Effect::kUnknown,
            owner + std::string(" knows no variable of this name"), nearest ? *nearest : ""};
}

VariableReport explainVariable(const Facts& facts, const std::optional<Stop>& stop,
                               const Variable& variable)
{
    const KnownVariable* known = findKnown(variable.name);
    if (!known && resembles(variable.name, "VYRA_"))
        return explainStranger(variable, "the library");
    if (resembles(variable.name, "GLSHARE_") && !isKnownToGlshare(variable.name))
        return explainStranger(variable, "glshare");
    if (!known)
        return {variable.name, variable.value, Effect::kNoted,
                "not the library's, but it steers what the library finds", ""};
    const Finding finding = stop && stop->step < known->readAt
                                ? withoutEffect("start-up stopped before it made a difference")
                                : known->explain(facts);
    return {variable.name, variable.value, finding.effect, finding.explanation, ""};
}

} // namespace

std::vector<VariableReport> explainVariables(const Facts& facts)
{
    const std::optional<Stop> stop = findStop(facts);
    std::vector<VariableReport> reports;
    for (const Variable& variable : facts.environment.variables)
        reports.push_back(explainVariable(facts, stop, variable));
    return reports;
}

const char* effectId(Effect effect)
{
    switch (effect) {
    case Effect::kChanged:
        return "changed";
    case Effect::kNone:
        return "none";
    case Effect::kUnknown:
        return "unknown";
    case Effect::kNoted:
        return "noted";
    }
    return "";
}

} // namespace info
