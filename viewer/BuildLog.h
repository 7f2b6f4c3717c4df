// What the OpenCL compiler has against a program text.
#pragma once

#include "viewer/OpenCLFunctions.h"

#include <optional>
#include <string>

namespace viewer {

// Builds the text for the library's device, with the options that the kernel store takes by
// default. Nothing when it builds; else the build log, or a sentence where there is none. Needs the
// library to be valid.
std::optional<std::string> buildLog(const OpenCLFunctions& cl, const std::string& source);

} // namespace viewer
