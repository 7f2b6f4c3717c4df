// Reads a model file.
#pragma once

#include "viewer/Failure.h"
#include "viewer/model/Model.h"
#include "viewer/model/import/ImportSettings.h"

#include <string>

namespace viewer {

// Reads a model in any format that Assimp supports, in this process. findModelFile resolves `name`.
// Returns a model that is upright along y, has at least one triangle with an area, and whose
// numbers are all finite. A failure names the file and the reason. A maliciously damaged file may
// crash Assimp or make it run endlessly: see importInChild. Throws std::bad_alloc if memory runs
// out.
[[nodiscard]] Result<Model> importModel(const std::string& name,
                                        const ImportSettings& settings = {});

} // namespace viewer
