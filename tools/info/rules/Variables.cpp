#include "tools/info/rules/Variables.h"

#include "tools/info/rules/Decisions.h"
#include "tools/info/rules/DriverRules.h"
#include "tools/info/rules/StartUpFailure.h"
#include "tools/info/rules/SyncDecisions.h"
#include "tools/info/text/NearestName.h"
#include "tools/info/text/TextFormatting.h"

#include "runtime/EnvironmentVariables.h"

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

Finding explainDisable(const Diagnostics&)
{
    return changed("switched OpenCL off: its presence alone counts, whatever the value");
}

Finding explainPlatform(const Diagnostics& diagnostics)
{
    return changed("set the vendor of the platform to look for, in place of the vendor id " +
                   hex(diagnostics.startUp.vendorId));
}

Finding explainMinimumVertices(const Diagnostics& diagnostics)
{
    return changed("set the number of vertices to " +
                   std::to_string(diagnostics.startUp.minimumVertices) +
                   " (a value that is negative or not a number reads as 0)");
}

bool sameVerdict(const DriverVerdict& one, const DriverVerdict& other)
{
    return one.usable == other.usable && one.implicitSync == other.implicitSync;
}

Finding explainIgnoreDriver(const Diagnostics& diagnostics)
{
    if (diagnostics.startUp.provider != kNVIDIAProvider)
        return withoutEffect("the platform is not NVIDIA's");
    const auto with = judgeChosenDriver(diagnostics, diagnostics.environment.ignoreDriverVersion);
    const auto without = judgeChosenDriver(diagnostics, std::nullopt);
    if (!with || !without)
        return withoutEffect("the driver's version cannot be parsed");
    if (sameVerdict(*with, *without))
        return withoutEffect("the verdict on the driver is the same without it");
    return changed(with->usable == without->usable ? "trusted the driver's implicit synchronisation"
                                                   : "accepted a driver of the refused range");
}

Finding explainDoubleDemand(const Diagnostics& diagnostics)
{
    if (diagnostics.environment.requireDoublePrecision == 0)
        return withoutEffect("only a whole number other than 0 requires double precision");
    if (diagnostics.startUp.doublePrecision)
        return withoutEffect("the device has double precision");
    return changed("switched OpenCL off, since the device has no double precision");
}

Finding explainForceFinish(const Diagnostics& diagnostics)
{
    if (diagnostics.environment.syncModes.forceFinish == 0)
        return withoutEffect("only a whole number other than 0 forces finish calls");
    return changed("made both sides wait with finish calls");
}

// Explains a variable that forces a mode. `requested`, `mode` and `automatic` are numbers of modes.
Finding explainForcedMode(const Diagnostics& diagnostics, int requested, int highest, int mode,
                          int automatic)
{
    if (diagnostics.environment.syncModes.forceFinish != 0)
        return withoutEffect("VYRA_OPENCL_FORCE_FINISH takes precedence");
    if (requested < 1 || requested > highest)
        return withoutEffect("only the whole numbers 1 to " + std::to_string(highest) +
                             " force a mode");
    if (mode != requested)
        return withoutEffect("this machine does not support that mode; start-up prints a message");
    if (mode == automatic)
        return withoutEffect("the library chooses the same mode without it");
    return changed("forced this mode in place of mode " + std::to_string(automatic));
}

Finding explainGraphicsToCL(const Diagnostics& diagnostics)
{
    return explainForcedMode(diagnostics, diagnostics.environment.syncModes.graphicsToCL,
                             TopenCLInfo::kGraphicsToCLFinish, diagnostics.startUp.graphicsToCL,
                             automaticGraphicsToCLMode(diagnostics));
}

Finding explainCLToGraphics(const Diagnostics& diagnostics)
{
    return explainForcedMode(diagnostics, diagnostics.environment.syncModes.clToGraphics,
                             TopenCLInfo::kCLToGraphicsFinish, diagnostics.startUp.clToGraphics,
                             automaticCLToGraphicsMode(diagnostics));
}

Finding explainForceThreading(const Diagnostics& diagnostics)
{
    std::string text = "switched batching off: each buffer is acquired and released on its own";
    if (diagnostics.startUp.provider == kNVIDIAProvider)
        text += "; sharing from several threads is reported";
    return changed(text);
}

struct KnownVariable {
    const char* name;
    StartUpStep readAt; // the step that reads it, or the next one
    Finding (*explain)(const Diagnostics&);
};

constexpr KnownVariable kKnownVariables[] = {
    {kDisableOpenCLVariable, StartUpStep::kSwitch, explainDisable},
    {kPlatformVariable, StartUpStep::kVendor, explainPlatform},
    {kMinimumVerticesVariable, StartUpStep::kDevice, explainMinimumVertices},
    {kIgnoreDriverVersionVariable, StartUpStep::kDriver, explainIgnoreDriver},
    {kForceFinishVariable, StartUpStep::kSharingFunctions, explainForceFinish},
    {kGraphicsToCLSyncVariable, StartUpStep::kSharingFunctions, explainGraphicsToCL},
    {kCLToGraphicsSyncVariable, StartUpStep::kSharingFunctions, explainCLToGraphics},
    {kOffWithoutDoubleVariable, StartUpStep::kDoublePrecision, explainDoubleDemand},
    {kForceThreadingVariable, StartUpStep::kSwitch, explainForceThreading},
};

const KnownVariable* findKnown(const std::string& name)
{
    for (const KnownVariable& known : kKnownVariables) {
        if (name == known.name)
            return &known;
    }
    return nullptr;
}

// The variables of glshare; D3D11 only on Windows.
constexpr const char* kGlshareVariables[] = {"GLSHARE_GL_EVENT", "GLSHARE_CPU_AS_GPU",
                                             "GLSHARE_ZERO_COPY", "GLSHARE_D3D11"};

bool isKnownToGlshare(const std::string& name)
{
    return std::find(std::begin(kGlshareVariables), std::end(kGlshareVariables), name) !=
           std::end(kGlshareVariables);
}

// Returns whether the name begins with the prefix, which is in upper case, in any case.
bool resembles(const std::string& name, std::string_view prefix)
{
    return name.size() >= prefix.size() &&
           std::equal(prefix.begin(), prefix.end(), name.begin(), [](char expected, char found) {
               return std::toupper(static_cast<unsigned char>(found)) == expected;
           });
}

VariableReport reportUnknown(const Variable& variable, const char* owner)
{
    std::vector<std::string> names(std::begin(kGlshareVariables), std::end(kGlshareVariables));
    for (const KnownVariable& known : kKnownVariables)
        names.emplace_back(known.name);
    const std::string* nearest = nearestName(variable.name, names);
    return {variable.name, variable.value, Effect::kUnknown,
            owner + std::string(" has no variable of this name"), nearest ? *nearest : ""};
}

VariableReport explainVariable(const Diagnostics& diagnostics,
                               const std::optional<StartUpFailure>& failure,
                               const Variable& variable)
{
    const KnownVariable* known = findKnown(variable.name);
    if (!known && resembles(variable.name, "VYRA_"))
        return reportUnknown(variable, "the library");
    if (resembles(variable.name, "GLSHARE_") && !isKnownToGlshare(variable.name))
        return reportUnknown(variable, "glshare");
    if (!known)
        return {variable.name, variable.value, Effect::kNoted,
                "not read by the library; selects the OpenCL or the OpenGL in use", ""};
    const Finding finding = failure && failure->step < known->readAt
                                ? withoutEffect("start-up stopped before it made a difference")
                                : known->explain(diagnostics);
    return {variable.name, variable.value, finding.effect, finding.explanation, ""};
}

} // namespace

std::vector<VariableReport> explainVariables(const Diagnostics& diagnostics)
{
    const std::optional<StartUpFailure> failure = findStartUpFailure(diagnostics);
    std::vector<VariableReport> reports;
    for (const Variable& variable : diagnostics.environment.variables)
        reports.push_back(explainVariable(diagnostics, failure, variable));
    return reports;
}

const char* effectId(Effect effect) noexcept
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
