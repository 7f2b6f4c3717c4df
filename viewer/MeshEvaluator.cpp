#include "viewer/MeshEvaluator.h"

#include "runtime/TopenCLInfo.h"

namespace viewer {
namespace {

// The attributes of a mesh's node in the host's graph.
enum Attribute : std::uint64_t { kRest, kSkinned, kTwisted };

AutoCLEventList listOf(const std::array<AutoCLObject<cl_event>, 2>& events)
{
    AutoCLEventList list;
    for (const AutoCLObject<cl_event>& event : events)
        list.add(event);
    return list;
}

} // namespace

MeshEvaluator::MeshEvaluator(const OpenCLFunctions& cl, std::uint64_t number, bool hasBones,
                             KernelFiles& files)
    : fCL(cl), fRest(number, kRest), fSkinned(number, hasBones ? kSkinned : kRest),
      fTwisted(number, kTwisted), fRestPositions(TopenCLData::sPositionsName(), fRest),
      fRestNormals(TopenCLData::sNormalsName(), fRest),
      fTwist(cl, DeformerPlugs{fSkinned, fTwisted}, files)
{
    if (hasBones)
        fSkin.emplace(cl, DeformerPlugs{fRest, fSkinned}, files);
}

bool MeshEvaluator::valid() const
{
    return fTwist.valid() && (!fSkin || fSkin->valid());
}

void MeshEvaluator::renewKernels(KernelFiles& files)
{
    fTwist.renewKernel(files);
    if (fSkin)
        fSkin->renewKernel(files);
}

cl_int MeshEvaluator::setMesh(const Mesh& mesh, cl_command_queue queue)
{
    const AutoCLEventList lastUse = listOf(fWritten);
    cl_int status = fRestPositions.writeConstant(queue, mesh.positions, lastUse);
    if (status == CL_SUCCESS)
        status = fRestNormals.writeConstant(queue, mesh.normals, lastUse);
    if (status == CL_SUCCESS && fSkin)
        status = fSkin->setMesh(mesh, queue, lastUse);
    fData.setData(TopenCLData::sPositionsName(), fRest, fRestPositions.data());
    fData.setData(TopenCLData::sNormalsName(), fRest, fRestNormals.data());
    return status;
}

cl_int MeshEvaluator::evaluate(const MeshPose& pose, WorkerQueue& worker,
                               const VertexBuffer& positions, const VertexBuffer& normals,
                               Handover& handover)
{
    cl_int status = enqueueDeformers(pose, worker);
    if (status == CL_SUCCESS)
        status =
            enqueueWrite(TopenCLData::sPositionsName(), positions, worker, fWritten[0], handover);
    if (status == CL_SUCCESS)
        status = enqueueWrite(TopenCLData::sNormalsName(), normals, worker, fWritten[1], handover);
    worker.releaseBuffers();
    // Others are about to wait for these events: without a flush they might wait for ever.
    fCL.clFlush(worker.queue());
    if (status != CL_SUCCESS)
        return status;
    handOver(positions, fWritten[0], handover);
    handOver(normals, fWritten[1], handover);
    return CL_SUCCESS;
}

cl_int MeshEvaluator::enqueueDeformers(const MeshPose& pose, WorkerQueue& worker)
{
    if (!pose.deforms) {
        passThrough();
        return CL_SUCCESS;
    }
    // The frame before may have been enqueued on another queue and may still read its matrices.
    const AutoCLEventList lastUse = listOf(fWritten);
    if (fSkin) {
        const cl_int status = fSkin->evaluate(pose.bones, worker, lastUse, fData);
        if (status != CL_SUCCESS)
            return status;
    }
    return fTwist.evaluate(pose, worker, lastUse, fData);
}

// Deformers that are off: what goes into the chain comes out of it.
void MeshEvaluator::passThrough()
{
    fData.setData(TopenCLData::sPositionsName(), fTwisted, fRestPositions.data());
    fData.setData(TopenCLData::sNormalsName(), fTwisted, fRestNormals.data());
}

// Only this command needs the shared buffer: the deformers may be done before it is acquired.
cl_int MeshEvaluator::enqueueWrite(const TuniqueString& name, const VertexBuffer& target,
                                   WorkerQueue& worker, AutoCLObject<cl_event>& written,
                                   Handover& handover)
{
    AutoCLObject<cl_event> acquired;
    const cl_int status = TopenCLInfo::theOne().sharedBufferMgr().EnqueueAcquireSharedCLBuffer(
        worker.queue(), target.shared(), acquired.receive());
    if (status != CL_SUCCESS)
        return status;
    handover.acquired.push_back(acquired);

    const TopenCLDataBuffer& source = fData.getData(name, fTwisted);
    AutoCLEventList waits;
    waits.add(acquired);
    waits.add(source.bufferReadyEvent());
    const std::size_t bytes =
        std::size_t{source.descriptor().elementSizeInBytes()} * source.descriptor().elementCount();
    const cl_int copied =
        fCL.clEnqueueCopyBuffer(worker.queue(), source.buffer().get(), target.shared()->fMem.get(),
                                0, 0, bytes, waits.size(), waits.array(), written.receive());
    worker.trace("Write vertices", written);
    return copied;
}

void MeshEvaluator::handOver(const VertexBuffer& target, const AutoCLObject<cl_event>& written,
                             Handover& handover)
{
    if (!target.shared()->fInBatch) {
        handover.singles.push_back({target.shared()->fMem.get(), written});
        return;
    }
    const cl_event event = written.get();
    TopenCLInfo::theOne().sharedBufferMgr().EnqueueReleaseBatchedSharedCLBuffer(1, &event);
}

} // namespace viewer
