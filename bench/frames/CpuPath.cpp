#include "Path.h"
#include "VectorDeformation.h"

#include "evaluator/TwistDeformer.h"

#include <stdexcept>
#include <vector>

#include <tbb/blocked_range.h>
#include <tbb/parallel_for.h>

namespace {

// Vertices of a task: enough to hide the cost of a task, few enough to divide a single mesh.
constexpr std::size_t kGrain = 1024;

const vyra::TwistDeformer& twistOf(const vyra::DeformableMesh& deformable)
{
    const auto* twist =
        dynamic_cast<const vyra::TwistDeformer*>(deformable.deformers().back().get());
    if (!twist)
        throw std::runtime_error("the CPU path computes the chain skin,twist only");
    return *twist;
}

class CpuPath : public Path {
public:
    CpuPath(QOpenGLFunctions_3_3_Core& gl, viewer::Scene& scene) : fGL(gl), fScene(scene)
    {
        for (const viewer::CharacterMesh* mesh : scene.meshes())
            fSurfaces.push_back(mesh->shape().geometry->rest);
    }

    const char* name() const override { return "CPU"; }

    void deform() override
    {
        tbb::parallel_for(std::size_t{0}, fSurfaces.size(), [this](std::size_t i) {
            const viewer::CharacterMesh& mesh = *fScene.meshes()[i];
            const vyra::TwistDeformer& twist = twistOf(*mesh.deformable);
            const QMatrix4x4& space = mesh.pose.geometryMatrix; // of the twist, after skinning
            const VectorPose pose{&mesh.mesh(), &mesh.pose.bones, viewer::rowsOf(space),
                                  viewer::rowsOf(space.inverted()), twist.angle};
            vyra::Surface& surface = fSurfaces[i];
            using Range = tbb::blocked_range<std::size_t>;
            tbb::parallel_for(Range(0, surface.vertexCount(), kGrain), [&](const Range& range) {
                deformWithVectors(pose, range.begin(), range.end(), surface.positions.data(),
                                  surface.normals.data());
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
    std::vector<vyra::Surface> fSurfaces;
};

} // namespace

std::unique_ptr<Path> makeCpuPath(QOpenGLFunctions_3_3_Core& gl, viewer::Scene& scene)
{
    return std::make_unique<CpuPath>(gl, scene);
}
