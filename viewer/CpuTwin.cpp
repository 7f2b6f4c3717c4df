#include "viewer/CpuTwin.h"

#include "viewer/CpuDeformation.h"

#include <chrono>

namespace viewer {

CpuTwin::CpuTwin(QOpenGLFunctions_3_3_Core& gl, const Model& model, const Animation* animation,
                 int crowd)
    : fGL(gl), fScene(gl, model, animation, crowd)
{
}

void CpuTwin::follow(const Scene& original)
{
    for (std::size_t i = 0; i < fScene.meshes().size(); ++i) {
        const CharacterMesh& from = *original.meshes()[i];
        CharacterMesh& to = *fScene.meshes()[i];
        to.pose = from.pose;
        if (to.level != from.level)
            fScene.changeLevel(to, EvaluationState::kClosed);
    }
    const auto begin = std::chrono::steady_clock::now();
    deformOnCpu(fGL, fScene);
    const auto end = std::chrono::steady_clock::now();
    fMilliseconds = std::chrono::duration<double, std::milli>(end - begin).count();
}

} // namespace viewer
