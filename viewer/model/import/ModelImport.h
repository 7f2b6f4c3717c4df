// From a model file to a Model.
#pragma once

#include "viewer/Failure.h"
#include "viewer/model/Model.h"

#include <optional>
#include <string>

struct aiScene;

namespace viewer {

enum class UpAxis { kX, kY, kZ };

struct ImportSettings {
    // The axis that points up in the file's coordinates; unset: the one that the file names, else
    // y.
    std::optional<UpAxis> up;
    // Degrees, 0 to 180. In a mesh whose file has no normals, an edge between triangles that meet
    // at a larger angle stays sharp.
    double creaseAngle = 60;
};

// Reads a model in any format that Assimp supports, in this process. `name` is resolved by
// findModelFile. Returns a model with at least one triangle that has an area and with finite
// numbers only, upright along y, or a sentence about the file. Files that are damaged on purpose
// may crash Assimp or keep it busy without end: see ImportProcess.h.
Result<Model> importModel(const std::string& name, const ImportSettings& settings = {});

// Converts a scene in the form that Assimp's post-processing leaves it in: validated, triangulated,
// with a root node and a material for each mesh. All numbers of it are finite, but for normals and
// colours. The rest of importModel is Assimp's work.
Model convertScene(const aiScene& scene, const ImportSettings& settings);

// Returns the weights of a vertex, scaled so that they add up to 1. All zero stays all zero.
BoneWeights normalised(const BoneWeights& weights);

} // namespace viewer
