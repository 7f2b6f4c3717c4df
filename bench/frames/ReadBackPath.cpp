#include "fixtures/DirectKernel.h"
#include "frames/Path.h"

#include "runtime/TopenCLInfo.h"

#include <array>
#include <stdexcept>
#include <vector>

#include <tbb/parallel_for.h>
#include <tbb/task_arena.h>

namespace {

using viewer::CharacterMesh;

AutoCLObject<cl_mem> createDeviceArray(std::size_t vertexCount)
{
    cl_int status = CL_SUCCESS;
    AutoCLObject<cl_mem> memory;
    memory.adopt(clCreateBuffer(TopenCLInfo::theOne().openCLContext(), CL_MEM_READ_WRITE,
                                vertexCount * sizeof(vyra::Vector3), nullptr, &status));
    requireSuccess(status);
    return memory;
}

// One mesh: its kernels, the device memory between them, and the host memory of the result.
class ReadBackMesh {
public:
    ReadBackMesh(CharacterMesh& mesh, ConstantCopies& constants, const DeviceSurface& rest)
        : fMesh(mesh), fRest(rest), fVertexCount(mesh.shape().geometry->rest.vertexCount())
    {
        for (const auto& deformer : mesh.deformable->deformers()) {
            for (unsigned pass = 0; pass < deformer->passCount(); ++pass)
                fKernels.push_back(std::make_unique<DirectKernel>(*deformer, pass, constants));
        }
        for (DeviceSurface& surface : fMemory)
            surface = {createDeviceArray(fVertexCount), createDeviceArray(fVertexCount)};
        fResult.positions.resize(fVertexCount);
        fResult.normals.resize(fVertexCount);
    }

    void enqueue(cl_command_queue queue)
    {
        const DeviceSurface* input = &fRest;
        std::size_t next = 0;
        for (const auto& kernel : fKernels) {
            kernel->enqueue(queue, static_cast<cl_uint>(fVertexCount), *input, fMemory[next]);
            input = &fMemory[next];
            next = 1 - next;
        }
        const std::size_t bytes = fVertexCount * sizeof(vyra::Vector3);
        requireSuccess(clEnqueueReadBuffer(queue, input->positions.get(), CL_FALSE, 0, bytes,
                                           fResult.positions.data(), 0, nullptr, nullptr));
        requireSuccess(clEnqueueReadBuffer(queue, input->normals.get(), CL_FALSE, 0, bytes,
                                           fResult.normals.data(), 0, nullptr, nullptr));
    }

    void upload(QOpenGLFunctions_3_3_Core& gl) const
    {
        fMesh.positions.write(gl, fResult.positions);
        fMesh.normals.write(gl, fResult.normals);
    }

private:
    CharacterMesh& fMesh;
    const DeviceSurface& fRest;
    std::size_t fVertexCount;
    std::vector<std::unique_ptr<DirectKernel>> fKernels;
    std::array<DeviceSurface, 2> fMemory; // the passes alternate between them
    vyra::Surface fResult;
};

// Uses one in-order queue per thread. A mesh always uses the same queue.
class ReadBackPath : public Path {
public:
    ReadBackPath(QOpenGLFunctions_3_3_Core& gl, viewer::Scene& scene) : fGL(gl)
    {
        fQueues.resize(static_cast<std::size_t>(tbb::this_task_arena::max_concurrency()));
        for (cl_command_queue& queue : fQueues) {
            queue = TopenCLInfo::theOne().createOpenCLCommandQueue(nullptr);
            if (!queue)
                throw std::runtime_error("no command queue can be created");
        }
        for (CharacterMesh* mesh : scene.meshes())
            fMeshes.push_back(std::make_unique<ReadBackMesh>(*mesh, fConstants, restOf(*mesh)));
        // Creates the device copies of all constants, on one thread.
        for (const auto& mesh : fMeshes)
            mesh->enqueue(fQueues.front());
        clFinish(fQueues.front());
    }

    ~ReadBackPath() override
    {
        for (const cl_command_queue queue : fQueues) {
            clFinish(queue);
            clReleaseCommandQueue(queue);
        }
    }

    void deform() override
    {
        tbb::parallel_for(std::size_t{0}, fQueues.size(), [this](std::size_t i) {
            for (std::size_t mesh = i; mesh < fMeshes.size(); mesh += fQueues.size())
                fMeshes[mesh]->enqueue(fQueues[i]);
            clFlush(fQueues[i]);
        });
        for (const cl_command_queue queue : fQueues)
            clFinish(queue);
        for (const auto& mesh : fMeshes)
            mesh->upload(fGL);
    }

private:
    // Meshes of the same geometry share their rest pose, as in the evaluator.
    const DeviceSurface& restOf(const CharacterMesh& mesh)
    {
        const vyra::MeshGeometry& geometry = *mesh.shape().geometry;
        DeviceSurface& rest = fRest[&geometry];
        if (!rest.positions.get()) {
            fRestArrays.emplace_back(geometry.rest.positions);
            fRestArrays.emplace_back(geometry.rest.normals);
            const auto copy = [this](const vyra::ConstantArray& array) {
                AutoCLObject<cl_mem> memory;
                memory.adopt(fConstants.copyOf(array));
                retainCLObject(memory.get()); // the holder's reference
                return memory;
            };
            rest.positions = copy(fRestArrays[fRestArrays.size() - 2]);
            rest.normals = copy(fRestArrays.back());
        }
        return rest;
    }

    QOpenGLFunctions_3_3_Core& fGL;
    ConstantCopies fConstants;
    std::vector<vyra::ConstantArray> fRestArrays;
    std::map<const vyra::MeshGeometry*, DeviceSurface> fRest;
    std::vector<cl_command_queue> fQueues;
    std::vector<std::unique_ptr<ReadBackMesh>> fMeshes;
};

} // namespace

std::unique_ptr<Path> makeReadBackPath(QOpenGLFunctions_3_3_Core& gl, viewer::Scene& scene)
{
    return std::make_unique<ReadBackPath>(gl, scene);
}
