// Part of EvaluatorImplementation: the deformation of all meshes in one evaluation.
#include "evaluator/EvaluatorImplementation.h"
#include "evaluator/Failure.h"
#include "evaluator/ProfileScope.h"

#include <string>
#include <utility>

#include <tbb/parallel_for.h>

namespace vyra {

void EvaluatorImplementation::deformMeshes()
{
    fStatus = {};
    fFailure = {};
    fCounts.evaluations += 1;
    finishIfUnordered();
    if (!anyOutsideBatch())
        fUnbatchedReleased.reset();
    // A buffer outside the batch is acquired on a thread without an OpenGL context, and no mode
    // orders that after the renderer's commands.
    if (anyOutsideBatch() && fSettings.finishRenderer)
        fSettings.finishRenderer();
    fail(guarded([this] {
        fUnbatched.reserve(2 * fMeshes.size()); // releasing them must not fail
        collectWork();
        resetStatuses();
        return Status();
    }));
    if (fFailure.ok()) {
        releaseLeftOver();
        deformAll();
        reportLastEvents();
        releaseUnbatched();
        collectStatus();
        writeCpuSurfaces();
    }
    if (!fFailure.ok())
        fStatus = std::move(fFailure);
}

void EvaluatorImplementation::resetStatuses()
{
    for (const auto& mesh : fMeshes)
        mesh->state().status = mesh->state().creation;
}

// Isolated: a deformer that waits for tasks of its own must not run another mesh while it waits.
void EvaluatorImplementation::deformAll()
{
    for (const auto& queue : fQueues)
        queue->begin(fUnbatchedReleased.get());
    const auto deformOne = [this](std::size_t i) {
        tbb::this_task_arena::isolate([&] {
            const ProfileScope scope("Deform");
            const auto& [queue, mesh] = fWork[i];
            if (queue)
                queue->deform(*fLibrary);
            else
                deformOnCpu(*mesh);
        });
    };
    // Deforming never throws, but creating the tasks may.
    fail(guarded([&] {
        fArena.execute([&] {
            if (fWork.size() == 1)
                deformOne(0); // waking another thread would cost more
            else
                tbb::parallel_for(std::size_t{0}, fWork.size(), deformOne);
        });
        return Status();
    }));
}

// Lists the queues that have meshes, and the meshes that the CPU deforms.
void EvaluatorImplementation::collectWork()
{
    fWork.clear();
    for (const auto& queue : fQueues) {
        if (queue->hasMeshes())
            fWork.push_back({queue.get(), nullptr});
    }
    for (const auto& mesh : fMeshes) {
        if (!mesh->state().usesOpenCL)
            fWork.push_back({nullptr, mesh.get()});
    }
}

void EvaluatorImplementation::deformOnCpu(DeformableMesh& mesh)
{
    MeshState& state = mesh.state();
    if (!state.status.ok())
        return;
    state.status = ofMesh(mesh, guarded([&] {
                              Surface surface = mesh.geometry().rest;
                              for (const auto& deformer : mesh.deformers()) {
                                  Status status = deformOnCpu(mesh, *deformer, surface);
                                  if (!status.ok())
                                      return ofDeformer(*deformer, std::move(status));
                              }
                              state.surface = std::move(surface);
                              return Status();
                          }));
}

Status EvaluatorImplementation::deformOnCpu(const DeformableMesh& mesh, const Deformer& deformer,
                                            Surface& surface)
{
    if (!deformer.enabled)
        return {};
    return guarded([&] {
        std::string text = deformer.mismatch(mesh.geometry());
        if (text.empty())
            deformer.deform(mesh.geometry(), surface);
        return Status(std::move(text));
    });
}

void EvaluatorImplementation::writeCpuSurfaces()
{
    if (!fSettings.writeVertices)
        return;
    // By index, since the function may add meshes.
    for (std::size_t i = 0; i < fMeshes.size(); ++i) { // NOLINT(modernize-loop-convert)
        DeformableMesh& mesh = *fMeshes[i];
        if (!mesh.usesOpenCL() && mesh.status().ok() && !mesh.state().removed)
            fSettings.writeVertices(mesh, mesh.state().surface);
    }
}

void EvaluatorImplementation::collectStatus()
{
    fail(guarded([this] { return fStartStatus; }));
    for (const auto& mesh : fMeshes) {
        if (!mesh->status().ok())
            fail(guarded([&mesh] { return mesh->status(); }));
    }
}

// Keeps the first failure.
void EvaluatorImplementation::fail(Status status)
{
    if (fFailure.ok())
        fFailure = std::move(status);
}

} // namespace vyra
