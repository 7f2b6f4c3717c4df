// Converts a scene of Assimp to a Model.
#pragma once

#include "viewer/model/Model.h"
#include "viewer/model/import/ImportSettings.h"

struct aiScene;

namespace viewer {

// Converts a scene as Assimp's post-processing leaves it: validated, triangulated, with a root node
// and a material for each mesh. Normals and colours may be infinite or NaN; all other numbers are
// finite. Meshes without triangles are left out.
[[nodiscard]] Model convertScene(const aiScene& scene, const ImportSettings& settings);

} // namespace viewer
