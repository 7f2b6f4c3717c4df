#include "viewer/MeshEvaluator.h"

#include "runtime/TopenCLInfo.h"

namespace viewer {

MeshEvaluator::MeshEvaluator(const OpenCLFunctions& cl, std::uint64_t number, bool hasBones,
                             KernelFiles& files)
    : fCL(cl), fChain(cl, number, hasBones, files)
{
}

cl_int MeshEvaluator::setMesh(const Mesh& mesh, cl_command_queue queue)
{
    collectLastUse();
    return fChain.setMesh(mesh, queue, fLastUse);
}

void MeshEvaluator::collectLastUse()
{
    fLastUse = AutoCLEventList(); // keeps its storage
    for (const AutoCLObject<cl_event>& event : fWritten)
        fLastUse.add(event);
}

cl_int MeshEvaluator::evaluate(const MeshPose& pose, WorkerQueue& worker,
                               const VertexBuffer& positions, const VertexBuffer& normals,
                               Handover& handover)
{
    // The frame before may have been enqueued on another queue and may still read its matrices.
    collectLastUse();
    cl_int status = fChain.evaluate(pose, worker, fLastUse);
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

    const TopenCLDataBuffer& source = fChain.output(name);
    fWaits = AutoCLEventList(); // keeps its storage
    fWaits.add(acquired);
    fWaits.add(source.bufferReadyEvent());
    const std::size_t bytes =
        std::size_t{source.descriptor().elementSizeInBytes()} * source.descriptor().elementCount();
    const cl_int copied =
        fCL.clEnqueueCopyBuffer(worker.queue(), source.buffer().get(), target.shared()->fMem.get(),
                                0, 0, bytes, fWaits.size(), fWaits.array(), written.receive());
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
