#include "viewer/render/CpuScene.h"

#include "evaluator/ProfileScope.h"

#include <chrono>
#include <vector>

#include <tbb/parallel_for.h>

namespace viewer {

CpuScene::CpuScene(QOpenGLFunctions_3_3_Core& gl, const Model& model, const Animation* animation,
                   int crowd)
    : fGL(gl), fScene(gl, model, animation, crowd)
{
}

void CpuScene::update(const Scene& original)
{
    const std::vector<CharacterMesh*>& meshes = fScene.meshes();
    for (std::size_t i = 0; i < meshes.size(); ++i) {
        const CharacterMesh& from = *original.meshes()[i];
        meshes[i]->pose = from.pose;
        if (meshes[i]->level != from.level)
            fScene.changeLevel(*meshes[i]);
    }
    const vyra::ProfileScope scope("Deform on the CPU");
    const auto begin = std::chrono::steady_clock::now();
    std::vector<vyra::Surface> surfaces(meshes.size());
    tbb::parallel_for(std::size_t{0}, meshes.size(), [&](std::size_t i) {
        surfaces[i] = original.meshes()[i]->deformable->deformOnCpu();
    });
    for (std::size_t i = 0; i < meshes.size(); ++i) {
        meshes[i]->positions.write(fGL, surfaces[i].positions);
        meshes[i]->normals.write(fGL, surfaces[i].normals);
    }
    const auto end = std::chrono::steady_clock::now();
    fMilliseconds = std::chrono::duration<double, std::milli>(end - begin).count();
}

} // namespace viewer
