// The two deformers of a mesh on OpenCL. What they calculate is told in Deformation.h.
//
// A deformer reads the positions and normals that a TopenCLData holds for its input plug and stores
// those of its output plug there, for whoever comes behind it. Its commands go to a worker's queue,
// each after the events of the data that it reads. One thread at a time uses a deformer; from frame
// to frame it may be another, with another queue.
#pragma once

#include "buffers/TopenCLData.h"
#include "diagnostics/AutoCLEventList.h"
#include "viewer/Deformation.h"
#include "viewer/DeformerKernel.h"
#include "viewer/InputBuffer.h"
#include "viewer/WorkerQueues.h"

#include <vector>

namespace viewer {

// Where a deformer stands in its mesh's chain.
struct DeformerPlugs {
    Tplug input;
    Tplug output;
};

class SkinDeformer {
public:
    SkinDeformer(const OpenCLFunctions& cl, const DeformerPlugs& plugs, KernelFiles& files);

    bool valid() const { return fKernel.valid(); }
    void renewKernel(KernelFiles& files) { fKernel.renew(files); }
    // Uploads the weights of a mesh with bones, after `waits`.
    cl_int setMesh(const Mesh& mesh, cl_command_queue queue, const AutoCLEventList& waits);
    // The input is read-only and the output becomes memory of the worker's pool. `lastUse` are the
    // events behind which the bones of the frame before are no longer read.
    cl_int evaluate(const std::vector<MatrixRows>& bones, WorkerQueue& worker,
                    const AutoCLEventList& lastUse, TopenCLData& data);

private:
    DeformerPlugs fPlugs;
    DeformerKernel fKernel;
    InputBuffer fBoneIndices;
    InputBuffer fBoneWeights;
    InputBuffer fBones;
    AutoCLEventList fWaits; // of the command being enqueued; its storage serves every frame
};

class TwistDeformer {
public:
    TwistDeformer(const OpenCLFunctions& cl, const DeformerPlugs& plugs, KernelFiles& files);

    bool valid() const { return fKernel.valid(); }
    void renewKernel(KernelFiles& files) { fKernel.renew(files); }
    // Changes a writable input in place; the output of a read-only one becomes memory of the
    // worker's pool.
    cl_int evaluate(const MeshPose& pose, WorkerQueue& worker, const AutoCLEventList& lastUse,
                    TopenCLData& data);

private:
    cl_int uploadMatrices(const MeshPose& pose, cl_command_queue queue,
                          const AutoCLEventList& lastUse, TopenCLData& data);

    DeformerPlugs fPlugs;
    DeformerKernel fKernel;
    InputBuffer fGeometryMatrix;
    InputBuffer fInverseGeometryMatrix;
    AutoCLEventList fWaits; // as above
};

} // namespace viewer
