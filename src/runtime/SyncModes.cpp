#include "runtime/SyncModes.h"

#include "host/Environment.h"

#include <cstdio>

namespace {

TopenCLInfo::GraphicsToCLSyncMode forcedGraphicsToCLSyncMode(int variable,
                                                             const SyncAbilities& abilities)
{
    if (variable == TopenCLInfo::kGraphicsToCLImplicit && !abilities.glEvent)
        std::fprintf(
            stderr,
            "VYRA_GRAPHICSTOOPENCL_SYNC_MODE=1 (Implicit Graphics to OpenCL synchronization) is "
            "not supported because cl_khr_gl_event is not supported.  Vyra will run in implicit "
            "sync mode but expect unstable results.\n");
    if (variable == TopenCLInfo::kGraphicsToCLExplicit && !abilities.arbSync) {
        std::fprintf(stderr,
                     "Overriding VYRA_GRAPHICSTOOPENCL_SYNC_MODE=2 (Explicit Graphics to OpenCL "
                     "synchronization) because GL_ARB_sync is not supported.  Using glFinish to "
                     "synchronize.\n");
        return TopenCLInfo::kGraphicsToCLFinish;
    }
    return static_cast<TopenCLInfo::GraphicsToCLSyncMode>(variable);
}

TopenCLInfo::CLToGraphicsSyncMode forcedCLToGraphicsSyncMode(int variable,
                                                             const SyncAbilities& abilities)
{
    if (variable == TopenCLInfo::kCLToGraphicsImplicit && !abilities.glEvent) {
        std::fprintf(
            stderr,
            "Overriding VYRA_OPENCLTOGRAPHICS_SYNC_MODE=1 (Implicit OpenCL to Graphics "
            "synchronization) because cl_khr_gl_event is not supported.  Using clGetEventInfo to "
            "synchronize.\n");
        return TopenCLInfo::kCLToGraphicsEventQuery;
    }
    return static_cast<TopenCLInfo::CLToGraphicsSyncMode>(variable);
}

} // namespace

SyncModeVariables readSyncModeVariables()
{
    SyncModeVariables variables;
    variables.forceFinish = TenvironmentVariable("VYRA_OPENCL_FORCE_FINISH").asInt32(0);
    variables.graphicsToCL = TenvironmentVariable("VYRA_GRAPHICSTOOPENCL_SYNC_MODE").asInt32(0);
    variables.clToGraphics = TenvironmentVariable("VYRA_OPENCLTOGRAPHICS_SYNC_MODE").asInt32(0);
    return variables;
}

TopenCLInfo::GraphicsToCLSyncMode chooseGraphicsToCLSyncMode(int variable,
                                                             const SyncAbilities& abilities)
{
    if (variable >= TopenCLInfo::kGraphicsToCLImplicit &&
        variable <= TopenCLInfo::kGraphicsToCLFinish)
        return forcedGraphicsToCLSyncMode(variable, abilities);
    if (abilities.glEvent)
        return TopenCLInfo::kGraphicsToCLImplicit;
    return abilities.arbSync ? TopenCLInfo::kGraphicsToCLExplicit
                             : TopenCLInfo::kGraphicsToCLFinish;
}

TopenCLInfo::CLToGraphicsSyncMode chooseCLToGraphicsSyncMode(int variable,
                                                             const SyncAbilities& abilities)
{
    if (variable >= TopenCLInfo::kCLToGraphicsImplicit &&
        variable <= TopenCLInfo::kCLToGraphicsFinish)
        return forcedCLToGraphicsSyncMode(variable, abilities);
    return abilities.glEvent && abilities.implicitSyncTrusted
               ? TopenCLInfo::kCLToGraphicsImplicit
               : TopenCLInfo::kCLToGraphicsEventQuery;
}
