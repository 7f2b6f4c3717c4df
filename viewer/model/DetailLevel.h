// Lower level of detail of a mesh.
#pragma once

#include "viewer/model/Model.h"

namespace viewer {

// Simplifies by vertex clustering: vertices at rest in the same cell of a grid whose normals have
// the same signs are merged into the first of them. Degenerate triangles are removed. If none would
// be left, returns a copy of `mesh`.
[[nodiscard]] Mesh coarserMesh(const Mesh& mesh);

} // namespace viewer
