// Starts the library for a window.
#pragma once

#include "viewer/Failure.h"

#include <string>

class QOpenGLWindow;

namespace viewer {

// Chooses the OpenCL platform and initialises the library. Candidates, by precedence:
// - `platform`, a vendor name, if it is not empty,
// - the platform of VYRA_OPENCL_PLATFORM,
// - the platform of the renderer's adapter,
// - the only platform that shares with OpenGL.
// The window's context must be current, and a GLHost of the window must exist. `cpuIsAllowed` only
// changes the advice in the failure's text.
[[nodiscard]] Status startOpenCL(QOpenGLWindow& window, const std::string& platform,
                                 bool cpuIsAllowed);

} // namespace viewer
