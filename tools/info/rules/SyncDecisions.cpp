#include "tools/info/rules/SyncDecisions.h"

#include "tools/info/rules/DriverRules.h"

#include "runtime/EnvironmentVariables.h"

namespace info {
namespace {

// Returns the inputs of the library's choice.
SyncAbilities abilitiesOf(const Diagnostics& diagnostics)
{
    const Platform* platform = chosenPlatform(diagnostics);
    const std::optional<DriverVerdict> driver =
        judgeChosenDriver(diagnostics, diagnostics.environment.ignoreDriverVersion);
    return {
        .glEvent = platform && listsExtension(platform->extensions, "cl_khr_gl_event"),
        .arbSync = diagnostics.renderer.syncObjects,
        .implicitSyncTrusted =
            diagnostics.startUp.provider != kNVIDIAProvider || (driver && driver->implicitSync),
    };
}

// Returns the reason for a mode if a variable requests the mode `requested`.
std::string forcedReason(const std::string& variable, int requested, int mode, bool glEvent)
{
    const std::string assignment = variable + "=" + std::to_string(requested);
    if (mode != requested)
        return assignment + " requests a mode that this machine does not support, so the library "
                            "uses this one";
    if (requested == TopenCLInfo::kGraphicsToCLImplicit && !glEvent)
        return assignment +
               " forces it, although the platform does not list cl_khr_gl_event: expect "
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

TopenCLInfo::GraphicsToCLSyncMode automaticGraphicsToCLMode(const Diagnostics& diagnostics)
{
    return chooseGraphicsToCLSyncMode(0, abilitiesOf(diagnostics)).mode;
}

TopenCLInfo::CLToGraphicsSyncMode automaticCLToGraphicsMode(const Diagnostics& diagnostics)
{
    return chooseCLToGraphicsSyncMode(0, abilitiesOf(diagnostics)).mode;
}

Decision decideGraphicsToCL(const Diagnostics& diagnostics)
{
    const SyncModeVariables& requested = diagnostics.environment.syncModes;
    const SyncAbilities abilities = abilitiesOf(diagnostics);
    const TopenCLInfo::GraphicsToCLSyncMode mode = diagnostics.startUp.graphicsToCL;
    Decision decision{"graphics-to-opencl", "OpenCL waits for OpenGL by",
                      graphicsToCLModeName(mode), "", ""};
    if (requested.forceFinish != 0) {
        decision.reason = std::string(kForceFinishVariable) + " forces it";
        decision.variable = kForceFinishVariable;
    } else if (requested.graphicsToCL >= TopenCLInfo::kGraphicsToCLImplicit &&
               requested.graphicsToCL <= TopenCLInfo::kGraphicsToCLFinish) {
        decision.reason = forcedReason(kGraphicsToCLSyncVariable, requested.graphicsToCL, mode,
                                       abilities.glEvent);
        if (mode != automaticGraphicsToCLMode(diagnostics))
            decision.variable = kGraphicsToCLSyncVariable;
    } else if (abilities.glEvent) {
        decision.reason = "the platform lists cl_khr_gl_event";
    } else {
        decision.reason = std::string("the platform does not list cl_khr_gl_event, and OpenGL ") +
                          (abilities.arbSync ? "has" : "lacks") + " GL_ARB_sync";
    }
    return decision;
}

Decision decideCLToGraphics(const Diagnostics& diagnostics)
{
    const SyncModeVariables& requested = diagnostics.environment.syncModes;
    const SyncAbilities abilities = abilitiesOf(diagnostics);
    const TopenCLInfo::CLToGraphicsSyncMode mode = diagnostics.startUp.clToGraphics;
    Decision decision{"opencl-to-graphics", "OpenGL waits for OpenCL by",
                      clToGraphicsModeName(mode), "", ""};
    if (requested.forceFinish != 0) {
        decision.reason = std::string(kForceFinishVariable) + " forces it";
        decision.variable = kForceFinishVariable;
    } else if (requested.clToGraphics >= TopenCLInfo::kCLToGraphicsImplicit &&
               requested.clToGraphics <= TopenCLInfo::kCLToGraphicsFinish) {
        decision.reason =
            forcedReason(kCLToGraphicsSyncVariable, requested.clToGraphics, mode, true);
        if (mode != automaticCLToGraphicsMode(diagnostics))
            decision.variable = kCLToGraphicsSyncVariable;
    } else if (!abilities.glEvent) {
        decision.reason = "the platform does not list cl_khr_gl_event";
    } else if (!abilities.implicitSyncTrusted) {
        decision.reason = "NVIDIA drivers before 385.31 do not order OpenGL's drawing after OpenCL";
    } else {
        decision.reason = "the platform lists cl_khr_gl_event";
        const bool trusted =
            judgeChosenDriver(diagnostics, std::nullopt).value_or(DriverVerdict{}).implicitSync;
        if (diagnostics.startUp.provider == kNVIDIAProvider && !trusted)
            decision.variable = kIgnoreDriverVersionVariable;
    }
    return decision;
}

Decision decideThreadedSharing(const Diagnostics& diagnostics)
{
    Decision decision{"threaded-sharing", "Sharing from several threads",
                      diagnostics.startUp.threadedSharing ? "yes" : "no", "", ""};
    if (diagnostics.startUp.provider != kNVIDIAProvider) {
        decision.reason = "only NVIDIA's OpenGL sharing does not allow it";
    } else if (diagnostics.environment.find(kForceThreadingVariable)) {
        decision.reason = std::string(kForceThreadingVariable) + " is set";
        decision.variable = kForceThreadingVariable;
    } else {
        decision.reason = "NVIDIA's OpenGL sharing does not allow it";
    }
    return decision;
}

Decision decideBatching(const Diagnostics& diagnostics)
{
    const bool forced = diagnostics.environment.find(kForceThreadingVariable) != nullptr;
    if (forced) {
        return {"batching", "Shared buffers in one batch", "no",
                std::string(kForceThreadingVariable) +
                    " is set: each buffer is acquired on its own",
                kForceThreadingVariable};
    }
    return {"batching", "Shared buffers in one batch", "yes",
            "one acquire and one release cover all buffers", ""};
}

} // namespace info
