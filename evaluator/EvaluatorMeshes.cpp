// Part of EvaluatorImplementation: the meshes and the buffers that they share with OpenCL.
#include "evaluator/ConstantStorage.h"
#include "evaluator/EvaluatorImplementation.h"
#include "evaluator/Failure.h"

#include "diagnostics/CLErrorCodes.h"
#include "runtime/TopenCLInfo.h"

#include <algorithm>
#include <string>
#include <utility>

namespace vyra {

DeformableMesh& EvaluatorImplementation::add(std::unique_ptr<DeformableMesh> mesh,
                                             const VertexBuffers& buffers)
{
    DeformableMesh& added = *fMeshes.emplace_back(std::move(mesh));
    MeshState& state = added.state();
    try {
        if (state.creation.ok())
            state.creation = Status(findProblem(added.geometry()));
        if (state.creation.ok() && usesOpenCL() &&
            added.geometry().rest.vertexCount() >=
                static_cast<std::size_t>(TopenCLInfo::theOne().minimumBufferSize())) {
            state.usesOpenCL = true;
            state.creation = share(added, buffers);
        }
        state.creation = ofMesh(added, std::move(state.creation));
        state.status = state.creation;
    } catch (...) {
        destroy(added);
        throw;
    }
    return added;
}

// Shares the vertex buffers, uploads the rest pose, and assigns the mesh to the queue with the
// fewest vertices.
Status EvaluatorImplementation::share(DeformableMesh& mesh, const VertexBuffers& buffers)
{
    MeshState& state = mesh.state();
    const std::size_t bytes = mesh.geometry().rest.vertexCount() * sizeof(Vector3);
    cl_int status = CL_SUCCESS;
    state.rest = restPose(mesh.fGeometry);
    state.restMemory.positions = state.rest.positions.storage()->memory(status);
    if (status == CL_SUCCESS)
        state.restMemory.normals = state.rest.normals.storage()->memory(status);
    if (status != CL_SUCCESS)
        return Status(std::string("there is no device memory for its rest pose (") +
                          CLErrorCodeStr(status) + ")",
                      status);
    Status shared =
        shareBuffer(buffers.positions, buffers.d3d11Positions, bytes, "positions", state.positions);
    if (shared.ok())
        shared =
            shareBuffer(buffers.normals, buffers.d3d11Normals, bytes, "normals", state.normals);
    if (!shared.ok()) {
        unshare(state); // a batch acquires no buffer that is never written
        return shared;
    }
    const auto fewest =
        std::min_element(fQueues.begin(), fQueues.end(), [](const auto& a, const auto& b) {
            return a->vertexCount() < b->vertexCount();
        });
    (*fewest)->addMesh(mesh);
    return {};
}

Status EvaluatorImplementation::shareBuffer(std::uint32_t name, void* d3d11Buffer,
                                            std::size_t bytes, const char* what,
                                            const TopenCLSharedBuffer*& record)
{
    const std::string itsBuffer = std::string("its buffer of ") + what;
    cl_int status = CL_SUCCESS;
    record =
        manager().CreateSharedCLBuffer(TopenCLInfo::theOne().openCLContext(), CL_MEM_READ_WRITE,
                                       d3d11Buffer ? d3d11Buffer : &name, &status);
    if (!record) {
        if (status == CL_SUCCESS)
            status = CL_INVALID_GL_OBJECT; // the runtime gave no reason
        return Status("OpenCL cannot share " + itsBuffer + " (" + CLErrorCodeStr(status) +
                          "); check that the renderer created it",
                      status);
    }
    std::size_t size = 0;
    status = fCL->clGetMemObjectInfo(record->fMem.get(), CL_MEM_SIZE, sizeof(size), &size, nullptr);
    if (status != CL_SUCCESS)
        return Status("the size of " + itsBuffer + " is unknown (" + CLErrorCodeStr(status) +
                          "); check the OpenCL driver",
                      status);
    if (size < bytes)
        return Status(itsBuffer + " has " + std::to_string(size) +
                          " bytes, and the vertices need " + std::to_string(bytes),
                      CL_INVALID_BUFFER_SIZE);
    return {};
}

// Ends the sharing of the vertex buffers. No command uses them any more.
void EvaluatorImplementation::unshare(MeshState& state)
{
    for (const TopenCLSharedBuffer** record : {&state.positions, &state.normals}) {
        if (*record)
            manager().DestroyBatchedSharedCLBuffer(std::exchange(*record, nullptr));
    }
}

RestPose& EvaluatorImplementation::restPose(const std::shared_ptr<const MeshGeometry>& geometry)
{
    dropUnusedRestPoses(); // a former geometry may have had this address
    const auto [known, isNew] = fRestPoses.try_emplace(geometry.get());
    if (isNew) {
        known->second.geometry = geometry;
        known->second.rest = {ConstantArray(geometry->rest.positions),
                              ConstantArray(geometry->rest.normals)};
    }
    return known->second.rest;
}

void EvaluatorImplementation::dropUnusedRestPoses()
{
    std::erase_if(fRestPoses, [](const auto& entry) { return entry.second.geometry.expired(); });
}

void EvaluatorImplementation::remove(DeformableMesh& mesh)
{
    if (fBusy)
        mesh.state().removed = true;
    else
        destroy(mesh);
}

// Called while no command is being enqueued and every event is reported to the batch release.
void EvaluatorImplementation::destroy(DeformableMesh& mesh)
{
    MeshState& state = mesh.state();
    if (state.queue) {
        state.queue->finish();
        state.queue->removeMesh(mesh);
    }
    if (state.positions || state.normals) {
        releaseLeftOver();
        // The release follows the queue's commands, and the renderer may delete its buffers as soon
        // as this function returns.
        for (const cl_event released : {*fBatchReleased, fUnbatchedReleased.get()}) {
            if (released)
                fCL->clWaitForEvents(1, &released);
        }
        for (const TopenCLSharedBuffer* record : {state.positions, state.normals}) {
            if (record)
                std::erase(fUnbatched, record->fMem.get());
        }
        unshare(state);
    }
    std::erase_if(fMeshes, [&mesh](const auto& other) { return other.get() == &mesh; });
    dropUnusedRestPoses();
}

void EvaluatorImplementation::destroyRemovedMeshes()
{
    for (std::size_t i = fMeshes.size(); i-- > 0;) {
        if (fMeshes[i]->state().removed)
            destroy(*fMeshes[i]);
    }
}

} // namespace vyra
