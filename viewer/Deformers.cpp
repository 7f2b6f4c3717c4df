#include "viewer/Deformers.h"

#include <algorithm>

namespace viewer {
namespace {

// The inputs and outputs of one run of a deformer.
struct Flow {
    TopenCLDataBuffer inPositions;
    TopenCLDataBuffer inNormals;
    TopenCLDataBuffer outPositions;
    TopenCLDataBuffer outNormals;

    bool complete() const { return outPositions.buffer().get() && outNormals.buffer().get(); }
    cl_uint vertexCount() const { return inPositions.descriptor().elementCount(); }
};

Flow connect(const TopenCLData& data, const DeformerPlugs& plugs, WorkerQueue& worker)
{
    Flow flow;
    flow.inPositions = data.getData(TopenCLData::sPositionsName(), plugs.input);
    flow.inNormals = data.getData(TopenCLData::sNormalsName(), plugs.input);
    flow.outPositions = worker.createOutputBuffer(flow.inPositions, plugs.output);
    flow.outNormals = worker.createOutputBuffer(flow.inNormals, plugs.output);
    return flow;
}

// Positions and normals that one kernel wrote have one event.
void addOnce(AutoCLEventList& waits, const AutoCLObject<cl_event>& event)
{
    const cl_event* end = waits.array() + waits.size();
    if (std::find(waits.array(), end, event.get()) == end)
        waits.add(event);
}

// Makes `waits` all that the commands of a deformer wait for. Memory from a pool brings the event
// of the data that it held before.
void collectWaits(const Flow& flow, AutoCLEventList& waits)
{
    waits = AutoCLEventList(); // keeps its storage
    addOnce(waits, flow.inPositions.bufferReadyEvent());
    addOnce(waits, flow.inNormals.bufferReadyEvent());
    addOnce(waits, flow.outPositions.bufferReadyEvent());
    addOnce(waits, flow.outNormals.bufferReadyEvent());
}

// Tells the next deformer where the output is and when it is ready.
void publish(Flow& flow, const DeformerPlugs& plugs, const AutoCLObject<cl_event>& done,
             TopenCLData& data)
{
    flow.outPositions.setBufferReadyEvent(done);
    flow.outNormals.setBufferReadyEvent(done);
    data.setData(TopenCLData::sPositionsName(), plugs.output, flow.outPositions);
    data.setData(TopenCLData::sNormalsName(), plugs.output, flow.outNormals);
}

} // namespace

SkinDeformer::SkinDeformer(const OpenCLFunctions& cl, const DeformerPlugs& plugs,
                           KernelFiles& files)
    : fPlugs(plugs), fKernel(cl, "skin.cl", "skin", files),
      fBoneIndices(TuniqueString("boneIndices"), plugs.input),
      fBoneWeights(TuniqueString("boneWeights"), plugs.input),
      fBones(TuniqueString("bones"), plugs.input)
{
}

cl_int SkinDeformer::setMesh(const Mesh& mesh, cl_command_queue queue, const AutoCLEventList& waits)
{
    const cl_int status = fBoneIndices.writeConstant(queue, mesh.boneIndices, waits);
    return status == CL_SUCCESS ? fBoneWeights.writeConstant(queue, mesh.boneWeights, waits)
                                : status;
}

cl_int SkinDeformer::evaluate(const std::vector<MatrixRows>& bones, WorkerQueue& worker,
                              const AutoCLEventList& lastUse, TopenCLData& data)
{
    const cl_int uploaded = fBones.write(worker.queue(), bones.data(), bones.size(), lastUse);
    if (uploaded != CL_SUCCESS)
        return uploaded;
    worker.trace("Upload bones", fBones.buffer().bufferReadyEvent());
    Flow flow = connect(data, fPlugs, worker);
    if (!flow.complete())
        return CL_MEM_OBJECT_ALLOCATION_FAILURE;

    collectWaits(flow, fWaits);
    fWaits.add(fBones.buffer());
    AutoCLObject<cl_event> done;
    const cl_int status =
        fKernel.enqueue(worker.queue(), flow.vertexCount(), fWaits, done, flow.vertexCount(),
                        flow.inPositions.buffer().get(), flow.inNormals.buffer().get(),
                        fBoneIndices.memory(), fBoneWeights.memory(), fBones.memory(),
                        flow.outPositions.buffer().get(), flow.outNormals.buffer().get());
    if (status != CL_SUCCESS)
        return status;
    worker.trace("skin", done);
    publish(flow, fPlugs, done, data);
    return CL_SUCCESS;
}

TwistDeformer::TwistDeformer(const OpenCLFunctions& cl, const DeformerPlugs& plugs,
                             KernelFiles& files)
    : fPlugs(plugs), fKernel(cl, "twist.cl", "twist", files),
      fGeometryMatrix(TopenCLData::sGeometryMatrixName(), plugs.input),
      fInverseGeometryMatrix(TopenCLData::sInverseGeometryMatrixName(), plugs.input)
{
}

cl_int TwistDeformer::uploadMatrices(const MeshPose& pose, cl_command_queue queue,
                                     const AutoCLEventList& lastUse, TopenCLData& data)
{
    const MatrixRows matrix = rowsOf(pose.geometryMatrix);
    const MatrixRows inverse = rowsOf(pose.inverseGeometryMatrix);
    cl_int status = fGeometryMatrix.write(queue, &matrix, 1, lastUse);
    if (status == CL_SUCCESS)
        status = fInverseGeometryMatrix.write(queue, &inverse, 1, lastUse);
    data.setData(TopenCLData::sGeometryMatrixName(), fPlugs.input, fGeometryMatrix.data());
    data.setData(TopenCLData::sInverseGeometryMatrixName(), fPlugs.input,
                 fInverseGeometryMatrix.data());
    return status;
}

cl_int TwistDeformer::evaluate(const MeshPose& pose, WorkerQueue& worker,
                               const AutoCLEventList& lastUse, TopenCLData& data)
{
    const cl_int uploaded = uploadMatrices(pose, worker.queue(), lastUse, data);
    if (uploaded != CL_SUCCESS)
        return uploaded;
    worker.trace("Upload matrix", fGeometryMatrix.buffer().bufferReadyEvent());
    worker.trace("Upload matrix", fInverseGeometryMatrix.buffer().bufferReadyEvent());
    Flow flow = connect(data, fPlugs, worker);
    if (!flow.complete())
        return CL_MEM_OBJECT_ALLOCATION_FAILURE;

    collectWaits(flow, fWaits);
    fWaits.add(fGeometryMatrix.buffer());
    fWaits.add(fInverseGeometryMatrix.buffer());
    AutoCLObject<cl_event> done;
    const cl_int status =
        fKernel.enqueue(worker.queue(), flow.vertexCount(), fWaits, done, flow.vertexCount(),
                        flow.inPositions.buffer().get(), flow.inNormals.buffer().get(),
                        fGeometryMatrix.memory(), fInverseGeometryMatrix.memory(), pose.twist,
                        flow.outPositions.buffer().get(), flow.outNormals.buffer().get());
    if (status != CL_SUCCESS)
        return status;
    worker.trace("twist", done);
    publish(flow, fPlugs, done, data);
    return CL_SUCCESS;
}

} // namespace viewer
