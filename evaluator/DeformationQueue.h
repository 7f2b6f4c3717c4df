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

// An in-order queue of its own, with a pool for what passes between deformers.
//
// A mesh stays on its queue. Commands of one queue run in the order of enqueuing, so memory of the
// pool and the numbers of an evaluation may be overwritten by later commands without waiting, and
// the event of the last command covers all before it. One thread at a time uses an object.
class DeformationQueue {
public:
    // Null if the queue cannot be created, with the reason in `status`. Borrows the settings.
    static std::unique_ptr<DeformationQueue> create(const OpenCLFunctions& cl, std::size_t number,
                                                    const EvaluatorSettings& settings,
                                                    Status& status);
    // Waits for all commands.
    ~DeformationQueue();
    DeformationQueue(const DeformationQueue&) = delete;
    DeformationQueue& operator=(const DeformationQueue&) = delete;

    void addMesh(DeformableMesh& mesh);
    void removeMesh(DeformableMesh& mesh);
    bool hasMeshes() const { return !fMeshes.empty(); }
    // Of all meshes.
    std::size_t vertexCount() const;

    // Starts an evaluation. `releasedAlone` is the event of the last release of buffers outside the
    // batch, or null; it is borrowed until deform() returns.
    void begin(cl_event releasedAlone);
    // Creates the kernels of the enabled deformers that are missing or were replaced, also those
    // that the present settings do not need, sets the arguments that changed and uploads the
    // numbers of all meshes. Failures are in the statuses of the meshes. Never throws.
    void prepare(KernelLibrary& library) { collect(library, 1); }
    // The same for the kernels that are needed, which it enqueues and submits. Once after begin();
    // never throws.
    void deform(KernelLibrary& library);
    // The event of the last command since begin(); empty if there was none.
    const AutoCLObject<cl_event>& lastEvent() const { return fLast; }
    // Memory that deform() acquired outside the batch, and that is to be released after
    // lastEvent().
    const std::vector<cl_mem>& acquiredAlone() const { return fAcquiredAlone; }
    // Waits for all commands.
    void finish();
    void recordTrace();

    std::size_t buffersCreated() const { return fSeen.size(); }
    std::size_t buffersReused() const { return fReused; }

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
    cl_int acquireAlone(const TopenCLSharedBuffer& buffer, AutoCLObject<cl_event>& acquired);
    Status createScratch(std::size_t vertexCount, VertexMemory& scratch);
    cl_mem createScratchArray(std::size_t vertexCount);
    void noteCommand(const char* name, AutoCLObject<cl_event>& enqueued);

    const OpenCLFunctions& fCL;
    cl_command_queue fQueue = nullptr; // owned
    TopenCLDataBufferPool fPool;
    FrameBlock fFrame;
    cl_int fUpload = CL_SUCCESS;                // of the numbers of this evaluation
    std::unique_ptr<CommandTimeline> fTimeline; // null: nothing is traced
    std::vector<DeformableMesh*> fMeshes;
    AutoCLObject<cl_event> fLast;
    AutoCLObject<cl_event> fFormerLast; // of the last evaluation before that enqueued anything
    RetiredMemory fRetired;             // released after fFormerLast
    std::vector<cl_mem> fAcquiredAlone;
    cl_event fReleasedAlone = nullptr; // an acquire outside the batch comes after it
    // Of the mesh whose target was acquired last.
    AutoCLObject<cl_event> fAcquiredPositions;
    AutoCLObject<cl_event> fAcquiredNormals;
    AutoCLEventList fWaits;           // of the command being enqueued; keeps its storage
    std::unordered_set<cl_mem> fSeen; // of the pool, which keeps all of them alive
    std::size_t fReused = 0;
};

} // namespace vyra
