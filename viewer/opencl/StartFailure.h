// Explains why OpenCL cannot be used.
#pragma once

#include "viewer/Failure.h"

#include "standalone/OpenCLPlatforms.h"

#include <string>
#include <vector>

namespace viewer {

// State of this machine and of the start that failed.
struct StartDiagnostics {
    bool libraryFound = true;     // the OpenCL library
    bool disabled = false;        // VYRA_DISABLE_OPENCL is set
    bool platformIsGiven = false; // with --platform or VYRA_OPENCL_PLATFORM
    bool cpuIsAllowed = false;    // --allow-cpu is given
    unsigned vendorId = 0;        // of the renderer's adapter; 0 if unknown
    std::string vendor;           // of the platform that the library looks for; may be empty
    std::vector<std::string> missingLayers; // of OPENCL_LAYERS
    std::vector<OpenCLPlatform> platforms;  // of this machine
    std::vector<std::string> warnings;      // of the library during its start
};

// Returns the first reason that applies, and advice without options that are set already.
[[nodiscard]] Failure startFailure(const StartDiagnostics& diagnostics);

} // namespace viewer
