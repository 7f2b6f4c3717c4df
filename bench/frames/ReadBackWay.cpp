#include "Way.h"

#include "runtime/TopenCLInfo.h"
#include "viewer/DeformerChain.h"
#include "viewer/KernelFiles.h"
#include "viewer/WorkerQueues.h"

#include <stdexcept>
#include <vector>

#include <tbb/parallel_for.h>

namespace {

using viewer::CharacterMesh;

// One mesh: its deformers, and where its vertices come back to.
struct MeshOutput {
    MeshOutput(const viewer::OpenCLFunctions& cl, std::uint64_t number, const CharacterMesh& mesh,
               viewer::KernelFiles& files)
        : chain(cl, number, mesh.mesh().hasBones(), files), positions(mesh.mesh().vertexCount()),
          normals(mesh.mesh().vertexCount())
    {
    }

    viewer::DeformerChain chain;
    std::vector<QVector3D> positions;
    std::vector<QVector3D> normals;
};

class ReadBackWay : public Way {
public:
    ReadBackWay(QOpenGLFunctions_3_3_Core& gl, const viewer::OpenCLFunctions& cl,
                viewer::Scene& scene)
        : fGL(gl), fScene(scene), fWorkers(cl), fFiles(cl)
    {
        if (!fWorkers.valid())
            throw std::runtime_error("OpenCL makes no command queues");
        std::uint64_t number = 0;
        for (const CharacterMesh* mesh : scene.meshes()) {
            fOutputs.push_back(std::make_unique<MeshOutput>(cl, ++number, *mesh, fFiles));
            viewer::DeformerChain& chain = fOutputs.back()->chain;
            if (!chain.valid())
                throw std::runtime_error("the kernels cannot be built");
            const cl_int status =
                chain.setMesh(mesh->mesh(), fWorkers.all().front()->queue(), AutoCLEventList());
            if (status != CL_SUCCESS)
                throw std::runtime_error("OpenCL does not take a mesh over");
        }
    }

    const char* name() const override { return "read back"; }

    void deform() override
    {
        fWorkers.arena().execute([this] {
            tbb::parallel_for(std::size_t{0}, fOutputs.size(), [this](std::size_t i) {
                enqueue(*fOutputs[i], fScene.meshes()[i]->pose, fWorkers.forThisThread());
            });
        });
        for (const auto& worker : fWorkers.all())
            clFinish(worker->queue());
        for (std::size_t i = 0; i < fOutputs.size(); ++i) {
            fScene.meshes()[i]->positions.write(fGL, fOutputs[i]->positions);
            fScene.meshes()[i]->normals.write(fGL, fOutputs[i]->normals);
        }
    }

private:
    // The frame before is finished: nothing is to be waited for.
    static void enqueue(MeshOutput& mesh, const viewer::MeshPose& pose, viewer::WorkerQueue& worker)
    {
        cl_int status = mesh.chain.evaluate(pose, worker, AutoCLEventList());
        if (status == CL_SUCCESS)
            status = enqueueRead(mesh.chain.output(TopenCLData::sPositionsName()), mesh.positions,
                                 worker);
        if (status == CL_SUCCESS)
            status =
                enqueueRead(mesh.chain.output(TopenCLData::sNormalsName()), mesh.normals, worker);
        worker.releaseBuffers();
        clFlush(worker.queue());
        if (status != CL_SUCCESS)
            throw std::runtime_error("OpenCL does not deform a mesh");
    }

    static cl_int enqueueRead(const TopenCLDataBuffer& source, std::vector<QVector3D>& target,
                              const viewer::WorkerQueue& worker)
    {
        AutoCLEventList waits;
        waits.add(source.bufferReadyEvent());
        return clEnqueueReadBuffer(worker.queue(), source.buffer().get(), CL_FALSE, 0,
                                   target.size() * sizeof(QVector3D), target.data(), waits.size(),
                                   waits.array(), nullptr);
    }

    QOpenGLFunctions_3_3_Core& fGL;
    viewer::Scene& fScene;
    viewer::WorkerQueues fWorkers;
    viewer::KernelFiles fFiles;
    std::vector<std::unique_ptr<MeshOutput>> fOutputs;
};

} // namespace

std::unique_ptr<Way> makeReadBackWay(QOpenGLFunctions_3_3_Core& gl,
                                     const viewer::OpenCLFunctions& cl, viewer::Scene& scene)
{
    return std::make_unique<ReadBackWay>(gl, cl, scene);
}
