// Part of TopenCLSharedBufferMgr: acquire and release around each evaluation and each drawing.
#include "diagnostics/CLStatusReport.h"
#include "host/EvaluationId.h"
#include "interop/GraphicsSync.h"
#include "interop/ProfilerScope.h"
#include "interop/SharedBufferMgrBlock.h"
#include "interop/TopenCLSharedBufferMgr.h"
#include "loader/OpenCLLoader.h"
#include "runtime/InteropFunctions.h"
#include "runtime/TopenCLInfo.h"

namespace {

bool acquiresWaitForFence()
{
    return TopenCLInfo::theOne().graphicsToCLSyncMode() == TopenCLInfo::kGraphicsToCLExplicit;
}

bool graphicsWaitsForSyncObjects()
{
    return TopenCLInfo::theOne().clToGraphicsSyncMode() == TopenCLInfo::kCLToGraphicsSyncObject;
}

} // namespace

void TopenCLSharedBufferMgr::PreEvaluate(const em::Id& id)
{
    if (!fBatchingEnabled)
        return;
    const ProfilerScope scope(sfAcquireBatchEventType);
    if (fEvaluationId != kNoEvaluation && fEvaluationId == id.value())
        return;

    if (fBatchDirty)
        UpdateBufferBatch();
    fEvaluationId = id.value();
    fReleaseEvent.reset();
    if (!fBatch.empty())
        AcquireBatch();
}

void TopenCLSharedBufferMgr::AcquireBatch()
{
    const cl_command_queue queue = TopenCLInfo::theOne().openCLCommandQueue();
    fBatchAcquired = true;
    if (acquiresWaitForFence())
        WaitForGraphicsFence();

    const cl_int status = sfEnqueueAcquireSharedObjects(queue, static_cast<cl_uint>(fBatch.size()),
                                                        bareHandles(fBatch.data()), 0, nullptr,
                                                        fAcquireEvent.receive());
    if (const cl_event acquired = fAcquireEvent.get()) {
        fImpl->fReleaseWaitEvents.append(acquired);
        ocl.clRetainEvent(acquired); // the list's reference, paid back by ReleaseBufferBatch
    }
    reportFailure(status);
}

// Makes the batch anew from the records, in the order of their handles. Takes no lock.
void TopenCLSharedBufferMgr::UpdateBufferBatch()
{
    fBatch.clear();
    fBatch.reserve(fBuffers.size());
    for (auto& [memory, record] : fBuffers) {
        fBatch.push_back(record.fMem);
        record.fInBatch = true;
    }
    fBatchDirty = false;
}

int TopenCLSharedBufferMgr::EnqueueAcquireSharedCLBuffer(cl_command_queue queue,
                                                         const TopenCLSharedBuffer* buffer,
                                                         cl_event* event)
{
    if (!buffer || !buffer->fMem.get())
        return CL_INVALID_ARG_VALUE;
    if (buffer->fInBatch) {
        *event = fAcquireEvent.get();
        if (*event)
            ocl.clRetainEvent(*event); // the caller's reference
        return CL_SUCCESS;
    }
    if (acquiresWaitForFence())
        WaitForGraphicsFence();
    return sfEnqueueAcquireSharedObjects(queue, 1, bareHandles(&buffer->fMem), 0, nullptr, event);
}

const cl_event* TopenCLSharedBufferMgr::EnqueueReleaseBatchedSharedCLBuffer(unsigned int numEvents,
                                                                            const cl_event* events)
{
    // While nothing is batched no release would ever pay the references back.
    if (fBatchingEnabled && events) {
        for (unsigned int index = 0; index < numEvents; ++index) {
            retainCLObject(events[index]); // paid back by ReleaseBufferBatch
            fImpl->fReleaseWaitEvents.append(events[index]);
        }
    }
    return bareHandles(&fReleaseEvent);
}

int TopenCLSharedBufferMgr::EnqueueReleaseSharedCLBuffer(cl_command_queue queue,
                                                         unsigned int numMemObjects,
                                                         const cl_mem* memObjects,
                                                         unsigned int numEvents,
                                                         const cl_event* waitList, cl_event* event)
{
    const cl_int status =
        sfEnqueueReleaseSharedObjects(queue, numMemObjects, memObjects, numEvents, waitList, event);
    if (fBatchingEnabled && status == CL_SUCCESS && event && *event &&
        graphicsWaitsForSyncObjects())
        fImpl->fGraphicsWaitEvents.append(*event);
    return status;
}

void TopenCLSharedBufferMgr::PostEvaluate(const em::Id& /*id*/)
{
    if (!fBatchingEnabled)
        return;
    const ProfilerScope scope(sfReleaseBatchEventType);
    fEvaluationId = kNoEvaluation;
    ReleaseBufferBatch();

    if (graphicsWaitsForSyncObjects()) {
        if (fReleaseEvent.get())
            GraphicsWaitForCLEvent(fReleaseEvent.get());
        fImpl->fGraphicsWaitEvents.forEach(GraphicsWaitForCLEvent);
    }
    fImpl->fGraphicsWaitEvents.clear();
    if (fBatchDirty)
        UpdateBufferBatch();
}

void TopenCLSharedBufferMgr::ReleaseBufferBatch()
{
    if (!fBatchingEnabled || !fBatchAcquired)
        return;
    if (!fBatch.empty()) {
        const cl_command_queue queue = TopenCLInfo::theOne().openCLCommandQueue();
        // The references move with the events from the list to its contiguous copy.
        std::vector<cl_event>& waitList = fImpl->fWaitListScratch;
        fImpl->fReleaseWaitEvents.copyTo(waitList);
        fImpl->fReleaseWaitEvents.clear();

        reportFailure(sfEnqueueReleaseSharedObjects(
            queue, static_cast<cl_uint>(fBatch.size()), bareHandles(fBatch.data()),
            static_cast<cl_uint>(waitList.size()), waitList.empty() ? nullptr : waitList.data(),
            fReleaseEvent.receive()));
        for (const cl_event event : waitList)
            releaseCLObject(event);
        waitList.clear();
    }
    fBatchAcquired = false;
}

void TopenCLSharedBufferMgr::RenderingComplete()
{
    if (fBatchingEnabled && acquiresWaitForFence())
        SetGraphicsFence();
}
