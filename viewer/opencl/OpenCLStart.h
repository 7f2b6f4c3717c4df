// Starts the library for a render window.
#pragma once

#include "viewer/Failure.h"
#include "viewer/app/Options.h"

class QOpenGLWindow;

namespace viewer {

// Chooses the OpenCL platform and initialises the library. --platform takes precedence over
// everything else; without it VYRA_OPENCL_PLATFORM stands as it is, else the platform follows from
// the renderer's adapter, or is the one that shares with OpenGL. The window's context is current,
// and the host's function table is filled.
Status startOpenCL(QOpenGLWindow& window, const Options& options);

} // namespace viewer
