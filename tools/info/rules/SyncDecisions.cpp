#include "tools/info/rules/SyncDecisions.h"

#include "tools/info/rules/DriverRules.h"

namespace info {
namespace {

constexpr char kForceFinish[] = "VYRA_OPENCL_FORCE_FINISH";
constexpr char kForceThreading[] = "VYRA_OPENCL_FORCE_THREADING";

// What the library weighs, from what was found.
SyncAbilities abilitiesOf(const Facts& facts)
{
    const Platform* platform = chosenPlatform(facts);
    const std::optional<DriverVerdict> driver =
        judgeChosenDriver(facts, facts.environment.ignoreDriverVersion);
    return {
        .glEvent = platform && listsExtension(platform->extensions, "cl_khr_gl_event"),
        .arbSync = facts.renderer.syncObjects,
        .implicitSyncTrusted =
            facts.startUp.provider != kNVIDIAProvider || (driver && driver->implicitSync),
    };
}

// The sentence for a mode that a variable forces, with what became of the wish.
std::string forcedReason(const std::string& variable, int wish, int mode, bool glEvent)
{
    const std::string assignment = variable + "=" + std::to_string(wish);
    if (mode != wish)
        return assignment +
               " asks for a mode that this machine lacks the means for, so the library "
               "takes this one";
    if (wish == TopenCLInfo::kGraphicsToCLImplicit && !glEvent)
        return assignment + " forces it, though the platform does not list cl_khr_gl_event: expect "
                            "wrong pictures";
    return assignment + " forces it";
}

} // namespace

std::string graphicsToCLModeName(TopenCLInfo::GraphicsToCLSyncMode mode)
{
    switch (mode) {
    case TopenCLInfo::kGraphicsToCLImplicit:
        return "implicit (1)";
    case TopenCLInfo::kGraphicsToCLExplicit:
        return "OpenGL fence (2)";
    case TopenCLInfo::kGraphicsToCLFinish:
        return "glFinish (3)";
    }
    return "unknown";
}

std::string clToGraphicsModeName(TopenCLInfo::CLToGraphicsSyncMode mode)
{
    switch (mode) {
    case TopenCLInfo::kCLToGraphicsImplicit:
        return "implicit (1)";
    case TopenCLInfo::kCLToGraphicsEventQuery:
        return "event query (2)";
    case TopenCLInfo::kCLToGraphicsSyncObject:
        return "OpenGL sync object (3)";
    case TopenCLInfo::kCLToGraphicsFinish:
        return "clFinish (4)";
    }
    return "unknown";
}

TopenCLInfo::GraphicsToCLSyncMode automaticGraphicsToCLMode(const Facts& facts)
{
    return chooseGraphicsToCLSyncMode(0, abilitiesOf(facts)).mode;
}

TopenCLInfo::CLToGraphicsSyncMode automaticCLToGraphicsMode(const Facts& facts)
{
    return chooseCLToGraphicsSyncMode(0, abilitiesOf(facts)).mode;
}

Decision decideGraphicsToCL(const Facts& facts)
{
    constexpr char kVariable[] = "VYRA_GRAPHICSTOOPENCL_SYNC_MODE";
    const SyncModeVariables& wishes = facts.environment.syncModes;
    const SyncAbilities abilities = abilitiesOf(facts);
    const TopenCLInfo::GraphicsToCLSyncMode mode = facts.startUp.graphicsToCL;
    Decision decision{"graphics-to-opencl", "OpenCL waits for OpenGL by",
                      graphicsToCLModeName(mode), "", ""};
    if (wishes.forceFinish != 0) {
        decision.reason = std::string(kForceFinish) + " forces it";
        decision.variable = kForceFinish;
    } else if (wishes.graphicsToCL >= TopenCLInfo::kGraphicsToCLImplicit &&
               wishes.graphicsToCL <= TopenCLInfo::kGraphicsToCLFinish) {
        decision.reason = forcedReason(kVariable, wishes.graphicsToCL, mode, abilities.glEvent);
        if (mode != automaticGraphicsToCLMode(facts))
            decision.variable = kVariable;
    } else if (abilities.glEvent) {
        decision.reason = "the platform lists cl_khr_gl_event";
    } else {
        decision.reason = std::string("the platform does not list cl_khr_gl_event, and OpenGL ") +
                          (abilities.arbSync ? "has" : "lacks") + " GL_ARB_sync";
    }
    return decision;
}

Decision decideCLToGraphics(const Facts& facts)
{
    constexpr char kVariable[] = "VYRA_OPENCLTOGRAPHICS_SYNC_MODE";
    const SyncModeVariables& wishes = facts.environment.syncModes;
    const SyncAbilities abilities = abilitiesOf(facts);
    const TopenCLInfo::CLToGraphicsSyncMode mode = facts.startUp.clToGraphics;
    Decision decision{"opencl-to-graphics", "OpenGL waits for OpenCL by",
                      clToGraphicsModeName(mode), "", ""};
    if (wishes.forceFinish != 0) {
        decision.reason = std::string(kForceFinish) + " forces it";
        decision.variable = kForceFinish;
    } else if (wishes.clToGraphics >= TopenCLInfo::kCLToGraphicsImplicit &&
               wishes.clToGraphics <= TopenCLInfo::kCLToGraphicsFinish) {
        decision.reason = forcedReason(kVariable, wishes.clToGraphics, mode, true);
        if (mode != automaticCLToGraphicsMode(facts))
            decision.variable = kVariable;
    } else if (!abilities.glEvent) {
        decision.reason = "the platform does not list cl_khr_gl_event";
    } else if (!abilities.implicitSyncTrusted) {
        decision.reason = "NVIDIA drivers before 385.31 do not order OpenGL's drawing after OpenCL";
    } else {
        decision.reason = "the platform lists cl_khr_gl_event";
        const bool trusted =
            judgeChosenDriver(facts, std::nullopt).value_or(DriverVerdict{}).implicitSync;
        if (facts.startUp.provider == kNVIDIAProvider && !trusted)
            decision.variable = "VYRA_OPENCL_IGNORE_DRIVER_VERSION";
    }
    return decision;
}

Decision decideThreadedSharing(const Facts& facts)
{
    Decision decision{"threaded-sharing", "Sharing from several threads",
                      facts.startUp.threadedSharing ? "yes" : "no", "", ""};
    if (facts.startUp.provider != kNVIDIAProvider) {
        decision.reason = "only NVIDIA's OpenGL sharing does not allow it";
    } else if (facts.environment.find(kForceThreading)) {
        decision.reason = std::string(kForceThreading) + " is set";
        decision.variable = kForceThreading;
    } else {
        decision.reason = "NVIDIA's OpenGL sharing does not allow it";
    }
    return decision;
}

Decision decideBatching(const Facts& facts)
{
    const bool forced = facts.environment.find(kForceThreading) != nullptr;
    if (forced)
        return {"batching", "Shared buffers in one batch", "no",
                std::string(kForceThreading) + " is set: each buffer is acquired on its own",
                kForceThreading};
    return {"batching", "Shared buffers in one batch", "yes",
            "one acquire and one release serve all buffers", ""};
}

} // namespace info
