#include "frames/Path.h"

#include <stdexcept>
#include <utility>
#include <vector>

#include <tbb/parallel_for.h>

namespace {

// The previous frame is finished, so the driver need not wait or copy.
constexpr GLbitfield kMapAccess = GL_MAP_WRITE_BIT | GL_MAP_UNSYNCHRONIZED_BIT;

class MappedCpuPath : public Path {
public:
    MappedCpuPath(QOpenGLFunctions_3_3_Core& gl, viewer::Scene& scene,
                  std::unique_ptr<CpuDeformation> deformation)
        : fGL(gl), fScene(scene), fDeformation(std::move(deformation)),
          fMapped(scene.meshes().size())
    {
    }

    void deform() override
    {
        const auto& meshes = fScene.meshes();
        for (std::size_t i = 0; i < meshes.size(); ++i)
            fMapped[i] = {map(meshes[i]->positions, *meshes[i]),
                          map(meshes[i]->normals, *meshes[i])};
        tbb::parallel_for(std::size_t{0}, meshes.size(), [this](std::size_t i) {
            fDeformation->deform(i, fMapped[i].positions, fMapped[i].normals);
        });
        for (const viewer::CharacterMesh* mesh : meshes) {
            unmap(mesh->positions);
            unmap(mesh->normals);
        }
    }

private:
    struct Mapped {
        vyra::Vector3* positions = nullptr;
        vyra::Vector3* normals = nullptr;
    };

    vyra::Vector3* map(const viewer::VertexBuffer& buffer, const viewer::CharacterMesh& mesh)
    {
        const std::size_t bytes = mesh.mesh().vertexCount() * sizeof(vyra::Vector3);
        fGL.glBindBuffer(GL_ARRAY_BUFFER, buffer.name());
        void* memory =
            fGL.glMapBufferRange(GL_ARRAY_BUFFER, 0, static_cast<GLsizeiptr>(bytes), kMapAccess);
        if (!memory)
            throw std::runtime_error("a vertex buffer cannot be mapped");
        return static_cast<vyra::Vector3*>(memory);
    }

    void unmap(const viewer::VertexBuffer& buffer)
    {
        fGL.glBindBuffer(GL_ARRAY_BUFFER, buffer.name());
        fGL.glUnmapBuffer(GL_ARRAY_BUFFER);
    }

    QOpenGLFunctions_3_3_Core& fGL;
    viewer::Scene& fScene;
    std::unique_ptr<CpuDeformation> fDeformation;
    std::vector<Mapped> fMapped;
};

class UploadCpuPath : public Path {
public:
    UploadCpuPath(QOpenGLFunctions_3_3_Core& gl, viewer::Scene& scene,
                  std::unique_ptr<CpuDeformation> deformation)
        : fGL(gl), fScene(scene), fDeformation(std::move(deformation))
    {
        for (const viewer::CharacterMesh* mesh : scene.meshes())
            fSurfaces.push_back(mesh->shape().geometry->rest);
    }

    void deform() override
    {
        tbb::parallel_for(std::size_t{0}, fSurfaces.size(), [this](std::size_t i) {
            fDeformation->deform(i, fSurfaces[i].positions.data(), fSurfaces[i].normals.data());
        });
        for (std::size_t i = 0; i < fSurfaces.size(); ++i) {
            fScene.meshes()[i]->positions.write(fGL, fSurfaces[i].positions);
            fScene.meshes()[i]->normals.write(fGL, fSurfaces[i].normals);
        }
    }

private:
    QOpenGLFunctions_3_3_Core& fGL;
    viewer::Scene& fScene;
    std::unique_ptr<CpuDeformation> fDeformation;
    std::vector<vyra::Surface> fSurfaces;
};

} // namespace

std::unique_ptr<Path> makeMappedCpuPath(QOpenGLFunctions_3_3_Core& gl, viewer::Scene& scene,
                                        std::unique_ptr<CpuDeformation> deformation)
{
    return std::make_unique<MappedCpuPath>(gl, scene, std::move(deformation));
}

std::unique_ptr<Path> makeUploadCpuPath(QOpenGLFunctions_3_3_Core& gl, viewer::Scene& scene,
                                        std::unique_ptr<CpuDeformation> deformation)
{
    return std::make_unique<UploadCpuPath>(gl, scene, std::move(deformation));
}
