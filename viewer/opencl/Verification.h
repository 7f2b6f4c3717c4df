// Compares the contents of the vertex buffers with the CPU reference.
#pragma once

#include "evaluator/Geometry.h"
#include "evaluator/SmoothDeformer.h"
#include "viewer/render/Scene.h"

#include <QOpenGLFunctions_3_3_Core>

namespace viewer {

// Bounds of a few units in the last place of single precision: kernels sum up four bones and rotate
// by sines and cosines that the default build options allow to be approximate.
inline constexpr double kPositionBound = 1e-5;
inline constexpr double kNormalBound = 1e-4;

// Largest differences over all vertices. NaN counts as infinite.
struct Deviation {
    double position = 0; // relative to the largest extent of a character
    // Length of the difference of two unit vectors, and its bound, at the vertex with the largest
    // ratio of both.
    double normal = 0;
    double normalBound = kNormalBound;

    // Extends this deviation to the larger one of both.
    void include(const Deviation& other) noexcept;
    [[nodiscard]] bool withinBound() const noexcept;
};

// Compares two surfaces with the same number of vertices. `toCharacter` is the transform from the
// space of both to character space, in which positions are compared.
//
// `topology` is not null if the normals were computed from its triangles. Rounded positions rotate
// the normals of small triangles more than those of large ones, so the bound of each normal is
// larger by the angle that the deviation of the positions explains.
[[nodiscard]] Deviation compare(const vyra::Surface& actual, const vyra::Surface& expected,
                                const QMatrix4x4& toCharacter,
                                const vyra::SmoothTopology* topology = nullptr);

// Reads every vertex buffer of the scene back from OpenGL and compares it with the result of the
// same deformers on the CPU. The OpenGL context must be current, and the frame ready to be drawn.
[[nodiscard]] Deviation verify(QOpenGLFunctions_3_3_Core& gl, const Scene& scene);

// Returns whether OpenCL deforms any mesh. If not, verify() compares the CPU with itself.
[[nodiscard]] bool deformsOnOpenCL(const Scene& scene);

} // namespace viewer
