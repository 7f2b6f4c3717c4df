// Copy of a scene that the CPU deforms, for comparison with the original.
#pragma once

#include "viewer/render/Scene.h"

#include <QOpenGLFunctions_3_3_Core>

namespace viewer {

// The OpenGL context must be current in all operations and the destructor.
class CpuScene {
public:
    // Takes the same arguments as the constructor of the original Scene.
    CpuScene(QOpenGLFunctions_3_3_Core& gl, const Model& model, const Animation* animation,
             int crowd);

    // Copies the poses and levels of detail of `original`, deforms on the CPU and uploads the
    // result.
    void update(const Scene& original);

    [[nodiscard]] const Scene& scene() const noexcept { return fScene; }
    // Duration of the last deformation and upload.
    [[nodiscard]] double milliseconds() const noexcept { return fMilliseconds; }

private:
    QOpenGLFunctions_3_3_Core& fGL;
    Scene fScene;
    double fMilliseconds = 0;
};

} // namespace viewer
