// Converts one mesh of an Assimp scene.
#pragma once

#include "viewer/model/Model.h"
#include "viewer/model/import/AssimpConversion.h"

#include <cstddef>

struct aiMesh;
struct aiScene;

namespace viewer {

// Converts `source`, a mesh of `scene`, for the node with the index `node`. The result has normals
// of length 1 and, if it has bones, weights that add up to 1 for each vertex. Bones that name no
// node of `nodes` are left out. `creaseAngle` is in degrees, see ImportSettings.
[[nodiscard]] Mesh convertMesh(const aiScene& scene, const aiMesh& source, std::size_t node,
                               const NodeIndex& nodes, double creaseAngle);

} // namespace viewer
