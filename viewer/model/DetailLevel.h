// A coarser mesh for a character that needs less detail.
#pragma once

#include "viewer/model/Model.h"

namespace viewer {

// Joins the vertices that share a cell of a grid over the mesh at rest and look the same way; the
// first of them, with its normal and its bones, stands for all. Triangles that collapse are left
// out. The result has at least one triangle, or it is the mesh itself.
Mesh coarserMesh(const Mesh& mesh);

} // namespace viewer
