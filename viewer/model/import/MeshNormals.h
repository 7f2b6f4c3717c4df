// Computes normals that a file lacks.
#pragma once

#include "viewer/model/Model.h"

namespace viewer {

// Sets `mesh.normals` to one normal of length 1 for each vertex. Before, it is empty or has an
// entry for each vertex; an entry that is zero or not finite is unusable.
// - If no entry is usable, the normal of each triangle corner is the mean of the adjacent triangles
//   whose angle with the corner's own triangle is at most `creaseAngle` degrees, weighted by their
//   angles at the vertex. A vertex whose corners have different normals is split.
// - Else each unusable entry becomes the mean of all adjacent triangles.
// A vertex whose triangles have no area gets (0, 1, 0). Triangles are adjacent to all vertices at
// the positions of their corners.
void completeNormals(Mesh& mesh, double creaseAngle);

// Reverses all normals if most of them point to the centre of the mesh, as in some files.
void orientNormalsOutwards(Mesh& mesh);

} // namespace viewer
