#include "VectorDeformation.h"
#include "Way.h"

#include <vector>

#include <tbb/blocked_range.h>
#include <tbb/parallel_for.h>

namespace {

// Vertices of a task: enough to hide what a task costs, few enough to share a single mesh out.
constexpr std::size_t kGrain = 1024;

class ProcessorWay : public Way {
public:
    ProcessorWay(QOpenGLFunctions_3_3_Core& gl, viewer::Scene& scene) : fGL(gl), fScene(scene)
    {
        for (const viewer::CharacterMesh* mesh : scene.meshes()) {
            const std::size_t count = mesh->mesh().vertexCount();
            fSurfaces.push_back({std::vector<QVector3D>(count), std::vector<QVector3D>(count)});
        }
    }

    const char* name() const override { return "processor"; }

    void deform() override
    {
        tbb::parallel_for(std::size_t{0}, fSurfaces.size(), [this](std::size_t i) {
            const viewer::CharacterMesh& mesh = *fScene.meshes()[i];
            viewer::Surface& surface = fSurfaces[i];
            using Range = tbb::blocked_range<std::size_t>;
            tbb::parallel_for(Range(0, surface.positions.size(), kGrain), [&](const Range& range) {
                deformWithVectors(mesh.mesh(), mesh.pose, range.begin(), range.end(),
                                  surface.positions.data(), surface.normals.data());
            });
        });
        for (std::size_t i = 0; i < fSurfaces.size(); ++i) {
            fScene.meshes()[i]->positions.write(fGL, fSurfaces[i].positions);
            fScene.meshes()[i]->normals.write(fGL, fSurfaces[i].normals);
        }
    }

private:
    QOpenGLFunctions_3_3_Core& fGL;
    viewer::Scene& fScene;
    std::vector<viewer::Surface> fSurfaces;
};

} // namespace

std::unique_ptr<Way> makeProcessorWay(QOpenGLFunctions_3_3_Core& gl, viewer::Scene& scene)
{
    return std::make_unique<ProcessorWay>(gl, scene);
}
