// Deforms on the CPU what OpenCL may not or cannot deform.
#pragma once

#include "viewer/Scene.h"

#include <QOpenGLFunctions_3_3_Core>

namespace viewer {

// Writes the present pose of every mesh that is not on OpenCL into its vertex buffers. On the
// renderer's thread, its context current; calculates on the threads of TBB.
void deformOnCpu(QOpenGLFunctions_3_3_Core& gl, const Scene& scene);

} // namespace viewer
