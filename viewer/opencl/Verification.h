// Compares what stands in the renderer's vertex buffers with the CPU reference.
#pragma once

#include "evaluator/Geometry.h"
#include "evaluator/SmoothDeformer.h"
#include "viewer/render/Scene.h"

#include <QOpenGLFunctions_3_3_Core>

namespace viewer {

// Differences of a few units in the last place of single precision, in which kernels sum up four
// bones and turn by sines and cosines that the default build options allow to be approximate.
inline constexpr double kPositionBound = 1e-5;
inline constexpr double kNormalBound = 1e-4;

// The largest differences over all vertices. A value that is not a number counts as infinite.
struct Deviation {
    double position = 0; // in parts of the character's largest extent
    // Length of the difference of two vectors of length 1, of the vertex that comes nearest to its
    // bound, and this bound.
    double normal = 0;
    double normalBound = kNormalBound;

    void include(const Deviation& other);
    bool withinBound() const;
};

// Compares two surfaces. `toCharacter` leads from the space of both to the character's, where
// positions are compared.
//
// With a `topology`, normals were computed from its triangles. Rounding of positions turns them the
// more, the smaller the triangles are, so their bound is larger by the angle that the deviation of
// the positions accounts for.
Deviation compare(const vyra::Surface& actual, const vyra::Surface& expected,
                  const QMatrix4x4& toCharacter, const vyra::SmoothTopology* topology = nullptr);

// Reads every vertex buffer of the scene back from OpenGL, and compares it with the CPU side of the
// deformers. On the renderer's thread, its context current, when the frame may be drawn.
Deviation verify(QOpenGLFunctions_3_3_Core& gl, const Scene& scene);

// Whether OpenCL deforms any mesh. If not, verify() compares the CPU with itself.
bool deformsOnOpenCL(const Scene& scene);

} // namespace viewer
