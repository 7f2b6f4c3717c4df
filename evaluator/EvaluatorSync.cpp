// Part of EvaluatorImplementation: releases, and the order of OpenCL and renderer commands.
#include "evaluator/EvaluatorImplementation.h"
#include "evaluator/Failure.h"

#include "diagnostics/CLErrorCodes.h"
#include "runtime/TopenCLInfo.h"

#include <algorithm>
#include <new>
#include <string>
#include <thread>
#include <utility>

namespace vyra {

// Reports one event per queue, which covers all commands of the queue.
void EvaluatorImplementation::reportLastEvents()
{
    if (batchSize() == 0)
        return; // there is no release
    for (const auto& queue : fQueues) {
        const cl_event last = queue->lastEvent().get();
        if (!last)
            continue;
        try {
            manager().EnqueueReleaseBatchedSharedCLBuffer(1, &last);
        } catch (const std::bad_alloc&) {
            fCL->clWaitForEvents(1, &last); // then the release need not wait
        }
    }
}

// Releases the buffers that the queues acquired outside the batch.
void EvaluatorImplementation::releaseUnbatched()
{
    fUnbatchedWaits = AutoCLEventList(); // keeps its storage
    for (const auto& queue : fQueues) {
        const std::vector<cl_mem>& acquired = queue->acquiredUnbatched();
        if (acquired.empty())
            continue;
        fUnbatched.insert(fUnbatched.end(), acquired.begin(), acquired.end()); // has capacity
        fCounts.acquires += acquired.size();
        const bool isListed = guarded([&] {
                                  fUnbatchedWaits.add(queue->lastEvent());
                                  return Status();
                              }).ok();
        if (!isListed || !queue->lastEvent().get())
            queue->finish(); // then the release need not wait
    }
    enqueueUnbatchedRelease();
}

// Releases the buffers whose earlier release failed.
void EvaluatorImplementation::releaseLeftOver()
{
    if (fUnbatched.empty())
        return;
    finish();
    fUnbatchedWaits = AutoCLEventList();
    enqueueUnbatchedRelease();
}

// Enqueues one command on this thread: the context that is current here orders the release before
// the drawing if the sharing extension orders the two. On the primary queue, because
// TopenCLInfo::finish waits for that queue.
void EvaluatorImplementation::enqueueUnbatchedRelease()
{
    if (fUnbatched.empty())
        return;
    const TopenCLInfo& info = TopenCLInfo::theOne();
    const cl_command_queue queue = info.openCLCommandQueue();
    // In this mode the manager borrows the event until PostEvaluate, and this object may be
    // destroyed earlier.
    const bool borrowed = info.clToGraphicsSyncMode() == TopenCLInfo::kCLToGraphicsSyncObject;
    fUnbatchedReleased.reset();
    const cl_int status = manager().EnqueueReleaseSharedCLBuffer(
        queue, static_cast<unsigned>(fUnbatched.size()), fUnbatched.data(), fUnbatchedWaits.size(),
        fUnbatchedWaits.array(), borrowed ? nullptr : fUnbatchedReleased.receive());
    if (status != CL_SUCCESS) {
        fail(guarded([status] {
            return Status(std::string("releasing vertex buffers outside the batch failed (") +
                              CLErrorCodeStr(status) + "); check the OpenCL driver",
                          status);
        }));
        return;
    }
    fUnbatched.clear();
    fCounts.releases += 1;
    if (borrowed)
        fCL->clEnqueueMarkerWithWaitList(queue, 0, nullptr, fUnbatchedReleased.receive());
    fUnordered = !fUnbatchedReleased.get();
    if (fUnordered)
        TopenCLInfo::finish(); // then no later command needs to wait for the release
}

// Nothing can wait for a release that failed or returned no event.
void EvaluatorImplementation::finishIfUnordered()
{
    if (std::exchange(fUnordered, false))
        finish();
}

bool EvaluatorImplementation::anyOutsideBatch() const
{
    return std::any_of(fMeshes.begin(), fMeshes.end(), [](const auto& mesh) {
        const MeshState& state = mesh->state();
        return state.queue && !(state.positions->fInBatch && state.normals->fInBatch);
    });
}

std::size_t EvaluatorImplementation::batchSize() const
{
    std::size_t buffers = 0;
    for (const auto& mesh : fMeshes) {
        for (const TopenCLSharedBuffer* buffer : {mesh->state().positions, mesh->state().normals})
            buffers += buffer && buffer->fInBatch ? 1 : 0;
    }
    return buffers;
}

void EvaluatorImplementation::waitUntilDrawable()
{
    if (!usesOpenCL())
        return;
    const cl_event unbatchedReleased = fUnbatchedReleased.get();
    switch (TopenCLInfo::theOne().clToGraphicsSyncMode()) {
    case TopenCLInfo::kCLToGraphicsImplicit:
        return; // the releases come before what this thread draws
    case TopenCLInfo::kCLToGraphicsEventQuery:
        TopenCLInfo::flush(); // a command that is never submitted is never complete
        pollUntilComplete(*fBatchReleased);
        pollUntilComplete(unbatchedReleased);
        break;
    case TopenCLInfo::kCLToGraphicsSyncObject:
        // PostEvaluate made the OpenGL stream wait for the batch.
        if (unbatchedReleased)
            fCL->clWaitForEvents(1, &unbatchedReleased);
        break;
    case TopenCLInfo::kCLToGraphicsFinish:
        TopenCLInfo::finish();
        break;
    }
}

// Returns also if the command failed, which TopenCLInfo::IsEventComplete does not report as
// complete.
void EvaluatorImplementation::pollUntilComplete(cl_event event) const
{
    const auto failed = [&] {
        cl_int status = CL_COMPLETE;
        fCL->clGetEventInfo(event, CL_EVENT_COMMAND_EXECUTION_STATUS, sizeof(status), &status,
                            nullptr);
        return status < 0;
    };
    while (!TopenCLInfo::IsEventComplete(event) && !failed())
        std::this_thread::yield();
}

void EvaluatorImplementation::renderingComplete()
{
    if (!usesOpenCL())
        return;
    manager().RenderingComplete();
    // A fence that is never flushed may never be signalled.
    if (fSettings.flushRenderer)
        fSettings.flushRenderer();
    for (const auto& queue : fQueues)
        queue->recordTrace();
}

} // namespace vyra
