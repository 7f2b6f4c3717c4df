#include "runtime/SyncModes.h"

#include "host/Environment.h"
#include "runtime/EnvironmentVariables.h"

namespace {

using GraphicsToCLChoice = SyncModeChoice<TopenCLInfo::GraphicsToCLSyncMode>;
using CLToGraphicsChoice = SyncModeChoice<TopenCLInfo::CLToGraphicsSyncMode>;

constexpr const char* kImplicitUnstable =
    "VYRA_GRAPHICSTOOPENCL_SYNC_MODE=1 (Implicit Graphics to OpenCL synchronization) is not supported because cl_khr_gl_event is not supported.  Vyra will run in implicit sync mode but expect unstable results.\n";
constexpr const char* kExplicitOverridden =
    "Overriding VYRA_GRAPHICSTOOPENCL_SYNC_MODE=2 (Explicit Graphics to OpenCL synchronization) because GL_ARB_sync is not supported.  Using glFinish to synchronize.\n";
constexpr const char* kImplicitOverridden =
    "Overriding VYRA_OPENCLTOGRAPHICS_SYNC_MODE=1 (Implicit OpenCL to Graphics synchronization) because cl_khr_gl_event is not supported.  Using clGetEventInfo to synchronize.\n";

} // namespace

SyncModeVariables readSyncModeVariables()
{
    SyncModeVariables variables;
    variables.forceFinish = TenvironmentVariable(kForceFinishVariable).asInt32(0);
    variables.graphicsToCL = TenvironmentVariable(kGraphicsToCLSyncVariable).asInt32(0);
    variables.clToGraphics = TenvironmentVariable(kCLToGraphicsSyncVariable).asInt32(0);
    return variables;
}

GraphicsToCLChoice chooseGraphicsToCLSyncMode(int variable, const SyncAbilities& abilities)
{
    switch (variable) {
    case TopenCLInfo::kGraphicsToCLImplicit:
        return {TopenCLInfo::kGraphicsToCLImplicit,
                abilities.glEvent ? nullptr : kImplicitUnstable};
    case TopenCLInfo::kGraphicsToCLExplicit:
        if (!abilities.arbSync)
            return {TopenCLInfo::kGraphicsToCLFinish, kExplicitOverridden};
        return {TopenCLInfo::kGraphicsToCLExplicit};
    case TopenCLInfo::kGraphicsToCLFinish:
        return {TopenCLInfo::kGraphicsToCLFinish};
    default:
        break; // automatic
    }
    if (abilities.glEvent)
        return {TopenCLInfo::kGraphicsToCLImplicit};
    return {abilities.arbSync ? TopenCLInfo::kGraphicsToCLExplicit
                              : TopenCLInfo::kGraphicsToCLFinish};
}

CLToGraphicsChoice chooseCLToGraphicsSyncMode(int variable, const SyncAbilities& abilities)
{
    switch (variable) {
    case TopenCLInfo::kCLToGraphicsImplicit:
        if (!abilities.glEvent)
            return {TopenCLInfo::kCLToGraphicsEventQuery, kImplicitOverridden};
        return {TopenCLInfo::kCLToGraphicsImplicit};
    case TopenCLInfo::kCLToGraphicsEventQuery:
    case TopenCLInfo::kCLToGraphicsSyncObject:
    case TopenCLInfo::kCLToGraphicsFinish:
        return {static_cast<TopenCLInfo::CLToGraphicsSyncMode>(variable)};
    default:
        break; // automatic
    }
    const bool implicit = abilities.glEvent && abilities.implicitSyncTrusted;
    return {implicit ? TopenCLInfo::kCLToGraphicsImplicit : TopenCLInfo::kCLToGraphicsEventQuery};
}
