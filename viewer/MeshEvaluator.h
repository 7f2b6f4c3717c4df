// One mesh of one character on OpenCL: from its shape at rest to the renderer's vertex buffers.
#pragma once

#include "viewer/DeformerChain.h"
#include "viewer/VertexBuffer.h"
#include "viewer/WorkerQueues.h"

#include <array>

#include <tbb/concurrent_vector.h>

namespace viewer {

// What the meshes of an evaluation leave for the thread that closes it.
struct Handover {
    // The last command on a buffer outside the batch, which is still acquired.
    struct Single {
        cl_mem memory;
        AutoCLObject<cl_event> written;
    };
    tbb::concurrent_vector<Single> singles;
    // The events with which buffers came: one and the same for all of a batch.
    tbb::concurrent_vector<AutoCLObject<cl_event>> acquired;
};

// Kernels and device data of one mesh. Its frames are evaluated by one thread at a time, each by
// any.
class MeshEvaluator {
public:
    // `number` tells the mesh from all others.
    MeshEvaluator(const OpenCLFunctions& cl, std::uint64_t number, bool hasBones,
                  KernelFiles& files);

    // False when a kernel is missing.
    bool valid() const { return fChain.valid(); }

    // Takes kernels of the texts that the files now stand for.
    void renewKernels(KernelFiles& files) { fChain.renewKernels(files); }

    // Uploads the mesh at rest. Again for another level of detail. A status of OpenCL.
    cl_int setMesh(const Mesh& mesh, cl_command_queue queue);

    // Enqueues one frame up to the writes into the two shared buffers, submits all of it, and hands
    // the last events over: those on batched buffers to the library, others to `handover`. A status
    // of OpenCL.
    cl_int evaluate(const MeshPose& pose, WorkerQueue& worker, const VertexBuffer& positions,
                    const VertexBuffer& normals, Handover& handover);

private:
    void collectLastUse();
    cl_int enqueueWrite(const TuniqueString& name, const VertexBuffer& target, WorkerQueue& worker,
                        AutoCLObject<cl_event>& written, Handover& handover);
    static void handOver(const VertexBuffer& target, const AutoCLObject<cl_event>& written,
                         Handover& handover);

    const OpenCLFunctions& fCL;
    DeformerChain fChain;
    std::array<AutoCLObject<cl_event>, 2> fWritten; // the last commands of the last frame
    AutoCLEventList fLastUse;                       // the same as a wait list
    AutoCLEventList fWaits; // of the command being enqueued; its storage serves every frame
};

} // namespace viewer
