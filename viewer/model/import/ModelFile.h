// Resolves the name of a model file.
#pragma once

#include "viewer/Failure.h"

#include <string>

namespace viewer {

// Returns the path of a regular, readable file that is not empty. If `name` does not exist, it is
// looked up among the sample models of Debian's package assimp-testmodels, such as "X/Testwuson.X".
// The failure contains the system's reason.
[[nodiscard]] Result<std::string> findModelFile(const std::string& name);

} // namespace viewer
