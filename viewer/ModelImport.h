// From a model file to a Model.
#pragma once

#include "viewer/Failure.h"
#include "viewer/Model.h"

#include <string>

namespace viewer {

// Reads any format that Assimp knows. A name that is no file is looked up among the sample models
// that Debian's package assimp-testmodels installs, so that "X/Testwuson.X" works as it stands.
Result<Model> importModel(const std::string& name);

// The weights of a vertex, scaled so that they add up to 1. All zero stays all zero.
BoneWeights normalised(const BoneWeights& weights);

} // namespace viewer
