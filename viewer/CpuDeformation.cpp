#include "viewer/CpuDeformation.h"

#include "viewer/ProfileScope.h"

#include <algorithm>
#include <iterator>
#include <vector>

#include <tbb/parallel_for.h>

namespace viewer {

void deformOnCpu(QOpenGLFunctions_3_3_Core& gl, const Scene& scene)
{
    std::vector<const CharacterMesh*> meshes;
    std::copy_if(scene.meshes().begin(), scene.meshes().end(), std::back_inserter(meshes),
                 [](const CharacterMesh* mesh) { return !mesh->onOpenCL; });
    if (meshes.empty())
        return;

    const ProfileScope scope("Deform on the CPU");
    std::vector<Surface> surfaces(meshes.size());
    tbb::parallel_for(std::size_t{0}, meshes.size(), [&](std::size_t i) {
        surfaces[i] = deform(meshes[i]->mesh(), meshes[i]->pose);
    });
    for (std::size_t i = 0; i < meshes.size(); ++i) {
        meshes[i]->positions.write(gl, surfaces[i].positions);
        meshes[i]->normals.write(gl, surfaces[i].normals);
    }
}

} // namespace viewer
