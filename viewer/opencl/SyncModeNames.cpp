#include "viewer/opencl/SyncModeNames.h"

namespace viewer {

const char* nameOf(TopenCLInfo::GraphicsToCLSyncMode mode)
{
    switch (mode) {
    case TopenCLInfo::kGraphicsToCLImplicit:
        return "1, implicit";
    case TopenCLInfo::kGraphicsToCLExplicit:
        return "2, explicit (fence)";
    case TopenCLInfo::kGraphicsToCLFinish:
        return "3, glFinish";
    }
    return "unknown";
}

const char* nameOf(TopenCLInfo::CLToGraphicsSyncMode mode)
{
    switch (mode) {
    case TopenCLInfo::kCLToGraphicsImplicit:
        return "1, implicit";
    case TopenCLInfo::kCLToGraphicsEventQuery:
        return "2, event query";
    case TopenCLInfo::kCLToGraphicsSyncObject:
        return "3, sync object";
    case TopenCLInfo::kCLToGraphicsFinish:
        return "4, clFinish";
    }
    return "unknown";
}

} // namespace viewer
