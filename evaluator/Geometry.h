// The evaluator's types of vertices, matrices and meshes.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace vyra {

// Three packed floats, as vertex buffers and kernels hold them.
struct Vector3 {
    float x = 0;
    float y = 0;
    float z = 0;
};
static_assert(sizeof(Vector3) == 3 * sizeof(float));

// The upper three rows of an affine 4x4 matrix. A point is transformed by the three dot products
// of the rows with (x, y, z, 1).
//
//     | m[0] m[1] m[2]  m[3]  |
//     | m[4] m[5] m[6]  m[7]  |
//     | m[8] m[9] m[10] m[11] |
using MatrixRows = std::array<float, 12>;

inline constexpr MatrixRows kIdentityRows = {1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1, 0};

// One position and one normal of length 1 per vertex. Both arrays have the same length.
struct Surface {
    std::vector<Vector3> positions;
    std::vector<Vector3> normals;

    std::size_t vertexCount() const { return positions.size(); }
};

// A mesh in its rest pose. Meshes that refer to the same object share its device memory.
struct MeshGeometry {
    std::string name; // for messages
    Surface rest;
    std::vector<std::uint32_t> triangles; // three vertex indices each; deformers that read
                                          // neighbours need them
};

} // namespace vyra
