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

#include <new>

namespace {

bool acquiresWaitForFence()
{
    return TopenCLInfo::theOne().graphicsToCLSyncMode() == TopenCLInfo::kGraphicsToCLExplicit;
}

bool graphicsWaitsForSyncObjects()
{
    return TopenCLInfo::theOne().clToGraphicsSyncMode() == TopenCLInfo::kCLToGraphicsSyncObject;
}

// Appends `event` with a reference of the list's own, which ReleaseBufferBatch releases. Throws
// std::bad_alloc, and keeps no reference, if the list cannot grow.
void appendOwned(ConcurrentEventList& list, cl_event event)
{
    retainCLObject(event);
    try {
        list.append(event);
    } catch (...) {
        releaseCLObject(event);
        throw;
    }
}

// Appends `event`, or waits for it if the list cannot grow: then no later command needs to. For an
// event whose command is enqueued already. Returns whether the event is in the list.
bool appendOrWait(ConcurrentEventList& list, cl_event event)
{
    try {
        list.append(event);
        return true;
    } catch (const std::bad_alloc&) {
        waitForEvent(event);
        return false;
    }
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
    fReleaseEvent.reset();
    if (!fBatch.empty())
        AcquireBatch();
    fEvaluationId = id.value();
}

void TopenCLSharedBufferMgr::AcquireBatch()
{
    const cl_command_queue queue = TopenCLInfo::theOne().openCLCommandQueue();
    if (acquiresWaitForFence())
        WaitForGraphicsFence();

    // Nothing below throws, so that the release that belongs to this acquire is always enqueued.
    fBatchAcquired = true;
    const cl_int status = sfEnqueueAcquireSharedObjects(queue, static_cast<cl_uint>(fBatch.size()),
                                                        rawHandles(fBatch.data()), 0, nullptr,
                                                        fAcquireEvent.receive());
    const cl_event acquired = fAcquireEvent.get();
    if (acquired && appendOrWait(fImpl->fReleaseWaitEvents, acquired))
        ocl.clRetainEvent(acquired); // the list's reference, released by ReleaseBufferBatch
    reportFailure(status);
}

// Rebuilds the batch from the records, in the order of their handles. Takes no lock. Throws
// std::bad_alloc, and leaves the batch unchanged, when memory runs out.
void TopenCLSharedBufferMgr::UpdateBufferBatch()
{
    fBatch.reserve(fBuffers.size());
    fBatch.clear();
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
    return sfEnqueueAcquireSharedObjects(queue, 1, rawHandles(&buffer->fMem), 0, nullptr, event);
}

const cl_event* TopenCLSharedBufferMgr::EnqueueReleaseBatchedSharedCLBuffer(unsigned int numEvents,
                                                                            const cl_event* events)
{
    // If batching is off, no release would ever release the references.
    if (fBatchingEnabled && events) {
        for (unsigned int index = 0; index < numEvents; ++index)
            appendOwned(fImpl->fReleaseWaitEvents, events[index]);
    }
    return rawHandles(&fReleaseEvent);
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
        appendOrWait(fImpl->fGraphicsWaitEvents, *event);
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
    if (!fBatchDirty)
        return;
    try {
        UpdateBufferBatch();
    } catch (const std::bad_alloc&) {
        // The batch stays dirty: the next PreEvaluate rebuilds it.
    }
}

void TopenCLSharedBufferMgr::ReleaseBufferBatch()
{
    if (!fBatchingEnabled || !fBatchAcquired)
        return;
    if (!fBatch.empty()) {
        const cl_command_queue queue = TopenCLInfo::theOne().openCLCommandQueue();
        const std::vector<cl_event>& waitList = fImpl->releaseWaitList();
        reportFailure(sfEnqueueReleaseSharedObjects(
            queue, static_cast<cl_uint>(fBatch.size()), rawHandles(fBatch.data()),
            static_cast<cl_uint>(waitList.size()), waitList.empty() ? nullptr : waitList.data(),
            fReleaseEvent.receive()));
        fImpl->fReleaseWaitEvents.forEach([](cl_event event) { releaseCLObject(event); });
        fImpl->fReleaseWaitEvents.clear();
    }
    fBatchAcquired = false;
}

void TopenCLSharedBufferMgr::RenderingComplete()
{
    if (fBatchingEnabled && acquiresWaitForFence())
        SetGraphicsFence();
}
