// Why OpenCL cannot be used, and what the user can do.
#pragma once

#include "viewer/Failure.h"

#include "standalone/OpenCLPlatforms.h"

#include <string>
#include <vector>

namespace viewer {

struct StartFacts {
    bool libraryFound = true;     // the OpenCL library
    bool disabled = false;        // VYRA_DISABLE_OPENCL is set
    bool platformIsGiven = false; // with --platform or VYRA_OPENCL_PLATFORM
    bool cpuIsAllowed = false;    // --allow-cpu is given
    unsigned vendorId = 0;        // of the renderer's adapter; 0: unknown
    std::string vendor;           // of the platform that the library looks for; may be empty
    std::vector<std::string> missingLayers; // of OPENCL_LAYERS
    std::vector<OpenCLPlatform> platforms;  // of this machine
    std::vector<std::string> warnings;      // of the library's start-up
};

// Returns one sentence for the first reason that applies. Advice leaves out what is given already.
Failure startFailure(const StartFacts& facts);

} // namespace viewer
