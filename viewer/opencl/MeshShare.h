// How many meshes are deformed by OpenCL and by the CPU.
#pragma once

#include <cstddef>
#include <string>

namespace viewer {

struct MeshShare {
    bool openCLIsUsed = false;
    std::size_t meshes = 0;
    std::size_t meshesOnCpu = 0; // if OpenCL is used
    int minimumVertices = 0;     // that OpenCL wants of a mesh

    bool allOnCpu() const { return !openCLIsUsed || meshesOnCpu == meshes; }
};

// Returns what deforms the meshes, and why it is not OpenCL.
std::string deformedBy(const MeshShare& share);

} // namespace viewer
