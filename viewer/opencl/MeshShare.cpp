#include "viewer/opencl/MeshShare.h"

namespace viewer {

std::string deformedBy(const MeshShare& share)
{
    if (!share.openCLIsUsed)
        return "the CPU, since OpenCL is not used";
    if (share.meshesOnCpu == 0)
        return "OpenCL, all of them";
    const std::string few = "fewer than " + std::to_string(share.minimumVertices) + " vertices";
    if (share.allOnCpu())
        return "the CPU, since all meshes have " + few;
    return "OpenCL, but " + std::to_string(share.meshesOnCpu) + " meshes by the CPU: they have " +
           few;
}

} // namespace viewer
