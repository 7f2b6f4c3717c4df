// Where a model file is, and whether it can be read at all.
#pragma once

#include "viewer/Failure.h"

#include <string>

namespace viewer {

// Returns the path of a model file that can be opened and read. A name that does not exist is
// looked up among the sample models that Debian's package assimp-testmodels installs, so that
// "X/Testwuson.X" works from every folder. The failure names the system's reason.
Result<std::string> findModelFile(const std::string& name);

} // namespace viewer
