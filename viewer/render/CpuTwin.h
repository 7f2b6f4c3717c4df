// A copy of a scene that the CPU deforms, to be seen and timed beside the original.
#pragma once

#include "viewer/render/Scene.h"

#include <QOpenGLFunctions_3_3_Core>

namespace viewer {

// All operations, and the destruction, need the renderer's context to be current.
class CpuTwin {
public:
    // Of the same model, animation and crowd as the original, as Scene borrows them.
    CpuTwin(QOpenGLFunctions_3_3_Core& gl, const Model& model, const Animation* animation,
            int crowd);

    // Takes over the original's present pose and levels of detail, and deforms.
    void follow(const Scene& original);

    const Scene& scene() const { return fScene; }
    // How long the last deformation took, until it could be drawn.
    double milliseconds() const { return fMilliseconds; }

private:
    QOpenGLFunctions_3_3_Core& fGL;
    Scene fScene;
    double fMilliseconds = 0;
};

} // namespace viewer
