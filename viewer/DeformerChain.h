// The deformers of one mesh in a row, from its shape at rest to memory of a worker's pool.
#pragma once

#include "buffers/TopenCLData.h"
#include "viewer/Deformers.h"
#include "viewer/InputBuffer.h"
#include "viewer/WorkerQueues.h"

#include <cstdint>
#include <optional>

namespace viewer {

// Frames are evaluated by one thread at a time, each by any.
class DeformerChain {
public:
    // `number` tells the mesh from all others.
    DeformerChain(const OpenCLFunctions& cl, std::uint64_t number, bool hasBones,
                  KernelFiles& files);

    // False when a kernel is missing.
    bool valid() const;

    // Takes kernels of the texts that the files now stand for.
    void renewKernels(KernelFiles& files);

    // Uploads the mesh at rest. Again for another level of detail. `lastUse` are the last commands
    // of the frame before, here and below. A status of OpenCL.
    cl_int setMesh(const Mesh& mesh, cl_command_queue queue, const AutoCLEventList& lastUse);

    // Enqueues one frame. A status of OpenCL.
    cl_int evaluate(const MeshPose& pose, WorkerQueue& worker, const AutoCLEventList& lastUse);

    // What comes out of the chain, with the event behind which it is ready: positions or normals,
    // by their standard names.
    const TopenCLDataBuffer& output(const TuniqueString& name) const;

private:
    void passThrough();

    Tplug fRest;    // the plugs along the chain
    Tplug fSkinned; // without bones the same as fRest
    Tplug fTwisted;
    InputBuffer fRestPositions;
    InputBuffer fRestNormals;
    std::optional<SkinDeformer> fSkin;
    TwistDeformer fTwist;
    TopenCLData fData;
};

} // namespace viewer
