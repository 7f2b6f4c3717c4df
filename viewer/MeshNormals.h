// Normals of meshes whose files leave some of them out.
#pragma once

#include "viewer/Model.h"

namespace viewer {

// Replaces each normal that is zero or not finite by the mean of the triangles around its vertex,
// weighted by area, and scales all of them to length 1. A vertex whose triangles have no area gets
// (0, 1, 0). `normals` has one entry for each position.
void completeNormals(Mesh& mesh);

// Reverses all normals of a mesh that point to its inside, as some files have them: the normals of
// a closed mesh point away from its middle.
void turnNormalsOutside(Mesh& mesh);

} // namespace viewer
