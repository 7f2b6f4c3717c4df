// Part of TopenCLSharedBufferMgr: construction, and creation and destruction of shared buffers.
#include "diagnostics/CLStatusReport.h"
#include "host/Environment.h"
#include "interop/SharedBufferMgrBlock.h"
#include "interop/TopenCLSharedBufferMgr.h"
#include "loader/OpenCLLoader.h"
#include "runtime/EnvironmentVariables.h"
#include "runtime/InteropFunctions.h"
#include "runtime/TopenCLInfo.h"

#include <algorithm>
#include <cstdio>
#include <utility>

namespace {

// Whether a manager has been constructed in this process: only the first one prints its message.
constinit bool sfConstructedOnce = false;

} // namespace

TopenCLSharedBufferMgr::TopenCLSharedBufferMgr()
    : fImpl(std::make_unique<TopenCLSharedBufferMgrImpl>())
{
    const bool forceThreading = VyraGetEnv(kForceThreadingVariable) != nullptr;
    fBatchingEnabled = !forceThreading;
    if (std::exchange(sfConstructedOnce, true))
        return;
    if (forceThreading)
        std::fprintf(stderr, "Deformer evaluator detected VYRA_OPENCL_FORCE_THREADING is set\n");
}

TopenCLSharedBufferMgr::TopenCLSharedBufferMgr(const TopenCLSharedBufferMgr& other)
    : fImpl(std::make_unique<TopenCLSharedBufferMgrImpl>()), fBatch(other.fBatch),
      fBuffers(other.fBuffers), fBatchDirty(other.fBatchDirty), fAcquireEvent(other.fAcquireEvent),
      fEvaluationId(other.fEvaluationId), fBatchAcquired(other.fBatchAcquired),
      fBatchingEnabled(other.fBatchingEnabled), fReleaseEvent(other.fReleaseEvent)
{
}

TopenCLSharedBufferMgr& TopenCLSharedBufferMgr::operator=(const TopenCLSharedBufferMgr& other)
{
    if (this == &other)
        return *this;
    // The list owns its references; it is not copied.
    fImpl->fReleaseWaitEvents.forEach([](cl_event event) { releaseCLObject(event); });
    fImpl->fReleaseWaitEvents.clear();
    fImpl->fGraphicsWaitEvents.clear();

    fBatch = other.fBatch;
    fBuffers = other.fBuffers;
    fBatchDirty = other.fBatchDirty;
    fAcquireEvent = other.fAcquireEvent;
    fEvaluationId = other.fEvaluationId;
    fBatchAcquired = other.fBatchAcquired;
    fBatchingEnabled = other.fBatchingEnabled;
    fReleaseEvent = other.fReleaseEvent;
    return *this;
}

TopenCLSharedBufferMgr::~TopenCLSharedBufferMgr()
{
    // Destroys the lists before the events that they may borrow; the other members follow in
    // reverse order.
    fImpl.reset();
}

const TopenCLSharedBuffer* TopenCLSharedBufferMgr::CreateSharedCLBuffer(cl_context context,
                                                                        cl_mem_flags flags,
                                                                        void* graphicsBuffer,
                                                                        int* errcode)
{
    AutoCLObject<cl_mem> created;
    *errcode = CL_SUCCESS;
    created.adopt(sfCreateSharedCLBuffer(context, flags, graphicsBuffer, errcode));
    if (*errcode != CL_SUCCESS || !created.get())
        return nullptr;

    const std::scoped_lock lock(fImpl->fMutex);
    TopenCLSharedBuffer& record = fBuffers[created.get()];
    // An exchange: `created` releases the reference of a record that already existed.
    record.fMem = std::move(created);
    fBatchDirty = true;
    return &record;
}

int TopenCLSharedBufferMgr::DestroySharedCLBuffer(const TopenCLSharedBuffer* buffer)
{
    const std::scoped_lock lock(fImpl->fMutex);
    int result = CL_SUCCESS;
    if (buffer->fInBatch)
        result = fBatchAcquired ? CL_INVALID_VALUE : DissolveBatch();
    fBuffers.erase(buffer->fMem.get());
    fBatchDirty = true;
    return result;
}

// Waits for the batch's last release and makes every buffer unbatched. Returns the status of the
// wait.
int TopenCLSharedBufferMgr::DissolveBatch()
{
    const int result = fReleaseEvent.get() ? waitForEvent(fReleaseEvent.get()) : CL_SUCCESS;
    fBatch.clear();
    for (auto& [memory, record] : fBuffers)
        record.fInBatch = false;
    return result;
}

int TopenCLSharedBufferMgr::DestroyBatchedSharedCLBuffer(const TopenCLSharedBuffer* buffer)
{
    const std::scoped_lock lock(fImpl->fMutex);
    if (buffer->fInBatch)
        LeaveBatch(*buffer);
    fBuffers.erase(buffer->fMem.get());
    return CL_SUCCESS;
}

// Removes one buffer from the batch, which keeps the order of the others.
void TopenCLSharedBufferMgr::LeaveBatch(const TopenCLSharedBuffer& record)
{
    const auto member = std::find_if(fBatch.begin(), fBatch.end(), [&](const auto& memory) {
        return memory.get() == record.fMem.get();
    });
    if (member == fBatch.end())
        return;
    if (fBatchAcquired)
        ReleaseUnbatched(record);
    fBatch.erase(member);
}

// Releases one buffer of the acquired batch, after all events reported so far, and waits for that.
// The events stay listed, since the release of the rest of the batch waits for them too.
void TopenCLSharedBufferMgr::ReleaseUnbatched(const TopenCLSharedBuffer& record)
{
    const std::vector<cl_event>& waitList = fImpl->releaseWaitList();
    AutoCLObject<cl_event> released;
    reportFailure(sfEnqueueReleaseSharedObjects(
        TopenCLInfo::theOne().openCLCommandQueue(), 1, rawHandles(&record.fMem),
        static_cast<cl_uint>(waitList.size()), waitList.empty() ? nullptr : waitList.data(),
        released.receive()));
    // A failed release returns no event to wait for.
    if (released.get())
        waitForEvent(released.get());
}
