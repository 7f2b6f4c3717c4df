// Normals of meshes whose files leave some or all of them out.
#pragma once

#include "viewer/model/Model.h"

namespace viewer {

// Makes `normals` complete: one of length 1 for each vertex. It is empty before, or has an entry
// for each vertex.
// - If no entry is usable, each corner of a triangle gets the mean of the triangles around it that
//   meet its own at an angle of at most `creaseAngle` degrees, weighted by their angles at the
//   vertex. A vertex at which the corners differ is split.
// - Else an entry that is zero or not finite becomes the mean of all triangles around its vertex.
// A vertex whose triangles have no area gets (0, 1, 0). Vertices at the same position share the
// triangles around them.
void completeNormals(Mesh& mesh, double creaseAngle);

// Reverses all normals of a mesh that point to its inside, as some files have them: the normals of
// a closed mesh point away from its middle.
void turnNormalsOutside(Mesh& mesh);

} // namespace viewer
