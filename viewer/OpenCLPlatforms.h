// Which OpenCL platform can share buffers with OpenGL.
#pragma once

#include "viewer/Failure.h"
#include "viewer/OpenCLFunctions.h"

#include <string>
#include <vector>

namespace viewer {

struct OpenCLPlatform {
    std::string vendor;
    std::string extensions;
};

// All platforms of this machine.
std::vector<OpenCLPlatform> openCLPlatforms(const OpenCLFunctions& cl);

// The vendor of the one platform that offers sharing with OpenGL. None, or several, is a failure
// that says how to go on.
Result<std::string> sharingVendor(const std::vector<OpenCLPlatform>& platforms);

} // namespace viewer
