// A command queue with the meshes whose kernels run on it. Internal.
#pragma once

#include "evaluator/CommandTimeline.h"
#include "evaluator/Evaluator.h"
#include "evaluator/FrameBlock.h"
#include "evaluator/KernelLibrary.h"
#include "evaluator/KernelPass.h"
#include "evaluator/OpenCLFunctions.h"
#include "evaluator/Status.h"

#include "buffers/TopenCLDataBufferPool.h"
#include "diagnostics/AutoCLEventList.h"
#include "diagnostics/AutoCLObject.h"

#include <cstddef>
#include <memory>
#include <string>
#include <unordered_set>
#include <vector>

#include <CL/cl.h>

struct TopenCLSharedBuffer;

namespace vyra {

// An in-order command queue, and a pool of memory for the results between two deformers.
//
// A mesh stays on its queue. Commands of one queue run in the order of enqueuing, so later
// commands may overwrite memory of the pool and the frame data without waiting, and the event of
// the last command covers all commands before it. One object is used by one thread at a time.
class DeformationQueue {
public:
    // Creates a queue. Returns null on failure, with the reason in `status`. Borrows the settings.
    [[nodiscard]] static std::unique_ptr<DeformationQueue> create(const OpenCLFunctions& cl,
                                                                  std::size_t number,
                                                                  const EvaluatorSettings& settings,
                                                                  Status& status);
    // Waits for all commands.
    ~DeformationQueue();
    DeformationQueue(const DeformationQueue&) = delete;
    DeformationQueue& operator=(const DeformationQueue&) = delete;

    void addMesh(DeformableMesh& mesh);
    void removeMesh(DeformableMesh& mesh);
    bool hasMeshes() const { return !fMeshes.empty(); }
    // Returns the number of vertices of all meshes.
    std::size_t vertexCount() const;

    // Starts an evaluation. `unbatchedReleased` is the event of the last release of buffers outside
    // the batch, or null; it is borrowed until deform() returns.
    void begin(cl_event unbatchedReleased);
    // Creates the kernels of the enabled deformers that are missing or were replaced (also those
    // that the present settings do not need), sets the arguments that changed and uploads the frame
    // data of all meshes. Failures are in the statuses of the meshes. Never throws.
    void prepare(KernelLibrary& library) { collect(library, 1); }
    // Does the same for the kernels that are needed, then enqueues and submits them. Called once
    // after begin(). Never throws.
    void deform(KernelLibrary& library);
    // Returns the event of the last command since begin(); empty if there was none.
    const AutoCLObject<cl_event>& lastEvent() const noexcept { return fLast; }
    // Returns the memory that deform() acquired outside the batch. The caller releases it after
    // lastEvent().
    const std::vector<cl_mem>& acquiredUnbatched() const noexcept { return fAcquiredUnbatched; }
    // Waits for all commands.
    void finish();
    void recordTrace();

    std::size_t buffersCreated() const noexcept { return fSeen.size(); }
    std::size_t buffersReused() const noexcept { return fReused; }

private:
    explicit DeformationQueue(const OpenCLFunctions& cl) : fCL(cl) {}

    void collect(KernelLibrary& library, unsigned leastPasses);
    Status collectMesh(DeformableMesh& mesh, KernelLibrary& library, unsigned leastPasses);
    Status collectPasses(DeformableMesh& mesh, std::size_t index, KernelLibrary& library,
                         unsigned leastPasses);
    Status enqueueMesh(DeformableMesh& mesh);
    Status enqueuePasses(DeformableMesh& mesh);
    Status enqueuePass(DeformableMesh& mesh, std::size_t index, VertexMemory& input,
                       VertexMemory& spare);
    Status enqueueRestPose(DeformableMesh& mesh);
    Status acquireTarget(const DeformableMesh& mesh);
    Status acquire(const TopenCLSharedBuffer& buffer, AutoCLObject<cl_event>& acquired);
    cl_int acquireUnbatched(const TopenCLSharedBuffer& buffer, AutoCLObject<cl_event>& acquired);
    Status createScratch(std::size_t vertexCount, VertexMemory& scratch);
    cl_mem createScratchArray(std::size_t vertexCount);
    void noteCommand(const char* name, AutoCLObject<cl_event>& enqueued);

    const OpenCLFunctions& fCL;
    cl_command_queue fQueue = nullptr; // owned
    TopenCLDataBufferPool fPool;
    FrameBlock fFrame;
    cl_int fUpload = CL_SUCCESS;                // status of the upload of the frame data
    std::unique_ptr<CommandTimeline> fTimeline; // null: nothing is traced
    std::vector<DeformableMesh*> fMeshes;
    AutoCLObject<cl_event> fLast;
    AutoCLObject<cl_event> fFormerLast; // of the last earlier evaluation that enqueued a command
    RetiredMemory fRetired;             // released after fFormerLast
    std::vector<cl_mem> fAcquiredUnbatched;
    cl_event fUnbatchedReleased = nullptr; // an acquire outside the batch comes after it
    // Of the mesh whose target was acquired last.
    AutoCLObject<cl_event> fAcquiredPositions;
    AutoCLObject<cl_event> fAcquiredNormals;
    AutoCLEventList fWaits;           // of the command being enqueued; keeps its storage
    std::unordered_set<cl_mem> fSeen; // of the pool, which keeps all of them alive
    std::size_t fReused = 0;
};

} // namespace vyra
