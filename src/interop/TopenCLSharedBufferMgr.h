// The vertex buffers that OpenCL and the viewport renderer share.
#pragma once

#include "VyraOpenCLExport.h"
#include "diagnostics/AutoCLObject.h"
#include "interop/TopenCLSharedBuffer.h"

#include <cstdint>
#include <map>
#include <memory>
#include <vector>

#include <CL/cl.h>

namespace em {
class Id;
}
struct TopenCLSharedBufferMgrImpl;

// Makes OpenCL memory objects of the renderer's vertex buffers and takes all of them through the
// cycle of acquire and release together.
//
// A shared buffer belongs to one side at a time: OpenCL uses it between an acquire and a release
// command, the renderer after the release. Around an evaluation the manager encloses all buffers of
// its batch in one acquire and one release; a buffer made since the last evaluation is on its own
// until the next.
//
//     PreEvaluate(id)                            one acquire for the whole batch
//       EnqueueAcquireSharedCLBuffer(...)        per buffer and thread: the event to wait for
//       ... kernels ...
//       EnqueueReleaseBatchedSharedCLBuffer(...) hands the last events over
//     PostEvaluate(id)                           one release, after all events handed over
//     ... drawing ...
//     RenderingComplete()                        the fence that the next acquire waits for
//
// PreEvaluate and PostEvaluate come in pairs and overlap with no other operation of the manager. At
// any other time the create and destroy operations, and between the two the acquire and release
// operations, may be called from several threads. RenderingComplete is called between evaluations,
// on the renderer's thread with its OpenGL context current.
//
// Running out of memory raises std::bad_alloc in CreateSharedCLBuffer, PreEvaluate and
// EnqueueReleaseBatchedSharedCLBuffer, and leaks nothing. An operation that has enqueued a command
// already waits for events instead of listing them, and does not throw.
//
// With VYRA_OPENCL_FORCE_THREADING set, nothing is batched: each buffer is acquired and released on
// its own.
class VYRA_OPENCL_API TopenCLSharedBufferMgr {
public:
    TopenCLSharedBufferMgr();
    // A copy has references of its own to all buffers and events, and empty event lists. Needs
    // `other` to itself.
    TopenCLSharedBufferMgr(const TopenCLSharedBufferMgr& other);
    TopenCLSharedBufferMgr& operator=(const TopenCLSharedBufferMgr& other);
    ~TopenCLSharedBufferMgr();

    // Makes a memory object of a renderer's buffer: `graphicsBuffer` is the address of an OpenGL
    // buffer name (32 bits), or an ID3D11Buffer. The record is the manager's; null when the
    // creation failed, with the status in `*errcode`, which must not be null. The buffer is on its
    // own until the next evaluation. Wraps clCreateFromGLBuffer or its Direct3D 11 counterparts.
    const TopenCLSharedBuffer* CreateSharedCLBuffer(cl_context context, cl_mem_flags flags,
                                                    void* graphicsBuffer, int* errcode);

    // Ends a buffer. One in the batch dissolves the batch, after its last release is done; while
    // the batch is acquired it stays in it until the release and the result is CL_INVALID_VALUE
    // (-30). Else the result is 0, or the status of the wait. The record is gone in every case.
    int DestroySharedCLBuffer(const TopenCLSharedBuffer* buffer);

    // Ends a buffer and keeps the batch. While the batch is acquired the buffer is released on its
    // own, after all events handed over so far, and the call waits for that. Always 0.
    int DestroyBatchedSharedCLBuffer(const TopenCLSharedBuffer* buffer);

    // Opens the evaluation `id`: brings the batch up to date, waits for the renderer's fence if the
    // mode requires it, and enqueues one acquire of the batch on the primary queue. Does nothing if
    // that evaluation is open already. If it throws, no evaluation is open and it can be tried
    // again.
    void PreEvaluate(const em::Id& id);

    // Closes the evaluation: one release of the batch, after all events handed over; in the
    // sync-object mode the OpenGL stream then waits for the releases, so a context of the
    // renderer's share group is current.
    void PostEvaluate(const em::Id& id);

    // Makes one buffer usable by commands on `queue`. `*event` receives the event to wait for,
    // whose reference is the caller's: the batch's own acquire, or that of an acquire enqueued for
    // a buffer outside the batch, where `event` may be null. CL_INVALID_ARG_VALUE (-50) for no
    // buffer or an empty one, else the status of the acquire.
    int EnqueueAcquireSharedCLBuffer(cl_command_queue queue, const TopenCLSharedBuffer* buffer,
                                     cl_event* event);

    // Makes the batch's release wait for `events`, each retained here. Returns the address at which
    // the event of the batch's release stands from PostEvaluate to the next PreEvaluate (null
    // otherwise); it stays valid for the manager's life. While nothing is batched the events stay
    // the caller's. If it throws, the events from the one that could not be listed on stay the
    // caller's.
    const cl_event* EnqueueReleaseBatchedSharedCLBuffer(unsigned int numEvents,
                                                        const cl_event* events);

    // Releases buffers outside the batch. In the sync-object mode the next PostEvaluate makes the
    // OpenGL stream wait for `*event`, which the caller keeps alive until then. Returns the status
    // of the release.
    int EnqueueReleaseSharedCLBuffer(cl_command_queue queue, unsigned int numMemObjects,
                                     const cl_mem* memObjects, unsigned int numEvents,
                                     const cl_event* waitList, cl_event* event);

    // Called after the renderer has drawn. If the mode requires it, replaces the fence that the
    // next acquire waits for. Must not overlap an acquire (PreEvaluate or
    // EnqueueAcquireSharedCLBuffer on any thread), which would find no fence while it is replaced
    // and would not wait for the drawing.
    void RenderingComplete();

private:
    void UpdateBufferBatch();
    void ReleaseBufferBatch();
    void AcquireBatch();
    int DissolveBatch();
    void LeaveBatch(const TopenCLSharedBuffer& record);
    void ReleaseAlone(const TopenCLSharedBuffer& record);

    std::unique_ptr<TopenCLSharedBufferMgrImpl> fImpl;
    std::vector<AutoCLObject<cl_mem>> fBatch;       // in the order of fBuffers at the last rebuild
    std::map<cl_mem, TopenCLSharedBuffer> fBuffers; // guarded by the block's mutex
    bool fBatchDirty = false;                       // records came or went since the last rebuild
    AutoCLObject<cl_event> fAcquireEvent;           // of the last batch acquire
    std::uint16_t fEvaluationId;                    // of the open evaluation; 0xFFFE when none is
    bool fBatchAcquired = false;                    // acquired and not released since
    bool fBatchingEnabled = true;
    AutoCLObject<cl_event> fReleaseEvent; // of the last batch release
};
