// Distribution of the meshes over OpenCL and the CPU.
#pragma once

#include <cstddef>
#include <string>

namespace viewer {

struct MeshDistribution {
    bool openCLIsUsed = false;
    std::size_t meshes = 0;
    std::size_t meshesOnCpu = 0; // if OpenCL is used
    int minimumVertices = 0;     // of a mesh that OpenCL deforms

    [[nodiscard]] bool allOnCpu() const noexcept { return !openCLIsUsed || meshesOnCpu == meshes; }
};

// Returns text about what deforms the meshes, with the reason if it is not OpenCL.
[[nodiscard]] std::string deformedBy(const MeshDistribution& distribution);

} // namespace viewer
