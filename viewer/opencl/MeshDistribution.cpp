#include "viewer/opencl/MeshDistribution.h"

namespace viewer {

std::string deformedBy(const MeshDistribution& distribution)
{
    if (!distribution.openCLIsUsed)
        return "the CPU, since OpenCL is not used";
    if (distribution.meshesOnCpu == 0)
        return "OpenCL, all of them";
    const std::string few =
        "fewer than " + std::to_string(distribution.minimumVertices) + " vertices";
    if (distribution.allOnCpu())
        return "the CPU, since all meshes have " + few;
    return "OpenCL, but " + std::to_string(distribution.meshesOnCpu) +
           " meshes by the CPU: they have " + few;
}

} // namespace viewer
