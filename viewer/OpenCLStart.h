// Starts the library for a render window.
#pragma once

#include "viewer/Failure.h"
#include "viewer/OpenCLFunctions.h"

#include <string>

class QOpenGLWindow;

namespace viewer {

// Chooses the OpenCL platform and initialises the library. `platform` is a vendor's name and wins
// over everything else; without one VYRA_OPENCL_PLATFORM stands as it is, else the platform follows
// from the renderer's adapter, or is the one that can share with OpenGL. The window's context is
// current, and the host's function table is filled.
Status startOpenCL(QOpenGLWindow& window, const OpenCLFunctions& cl, const std::string& platform);

} // namespace viewer
