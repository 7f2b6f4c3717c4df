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

// The manager of the memory objects that OpenCL shares with the renderer's vertex buffers. It owns
// them, and acquires and releases all of them as one batch.
//
// OpenCL uses a shared buffer between an acquire and a release command, the renderer after the
// release. Around an evaluation, the manager enqueues one acquire and one release for its batch. A
// buffer created since the last PreEvaluate is unbatched until the next.
//
//     PreEvaluate(id)                            one acquire for the whole batch
//       EnqueueAcquireSharedCLBuffer(...)        per buffer and thread: the event to wait for
//       ... kernels ...
//       EnqueueReleaseBatchedSharedCLBuffer(...) reports the last events
//     PostEvaluate(id)                           one release, after all reported events
//     ... drawing ...
//     RenderingComplete()                        the fence that the next acquire waits for
//
// PreEvaluate and PostEvaluate are called in pairs and must not overlap with another function of
// the manager. At any other time several threads may call the create and destroy functions, and
// between the two also the acquire and release functions. RenderingComplete is called between
// evaluations, on the renderer's thread with its OpenGL context current.
//
// CreateSharedCLBuffer, PreEvaluate and EnqueueReleaseBatchedSharedCLBuffer throw std::bad_alloc
// when memory runs out, and leak nothing. A function that has enqueued a command does not throw: it
// waits for the events that it cannot list.
//
// If VYRA_OPENCL_FORCE_THREADING is set, all buffers are unbatched.
class VYRA_OPENCL_API TopenCLSharedBufferMgr {
public:
    TopenCLSharedBufferMgr();
    // Copies the buffers and events with references of its own, but not the event lists. Must not
    // overlap with another use of `other`.
    TopenCLSharedBufferMgr(const TopenCLSharedBufferMgr& other);
    TopenCLSharedBufferMgr& operator=(const TopenCLSharedBufferMgr& other);
    ~TopenCLSharedBufferMgr();

    // Creates a memory object from a renderer's buffer: `graphicsBuffer` is the address of an
    // OpenGL buffer name (32 bits), or an ID3D11Buffer. Returns a record that the manager owns, or
    // null on failure; `*errcode` receives the status, and `errcode` must not be null. The buffer
    // is unbatched until the next PreEvaluate. Wraps clCreateFromGLBuffer or its Direct3D 11
    // counterparts.
    [[nodiscard]] const TopenCLSharedBuffer* CreateSharedCLBuffer(cl_context context,
                                                                  cl_mem_flags flags,
                                                                  void* graphicsBuffer,
                                                                  int* errcode);

    // Destroys the record of a buffer. If the buffer is in the batch:
    // - If the batch is not acquired, waits for its last release and dissolves the batch.
    // - If the batch is acquired, the memory object stays in it until the release, and the result
    // is
    //   CL_INVALID_VALUE (-30).
    // Otherwise returns the status of the wait, or 0.
    int DestroySharedCLBuffer(const TopenCLSharedBuffer* buffer);

    // Destroys the record of a buffer and keeps the batch of the others. If the batch is acquired,
    // releases the buffer after all events reported so far, and waits for that. Returns 0.
    int DestroyBatchedSharedCLBuffer(const TopenCLSharedBuffer* buffer);

    // Opens the evaluation `id`: updates the batch, waits for the renderer's fence if the mode
    // requires it, and enqueues one acquire of the batch on the primary queue. Does nothing if that
    // evaluation is open already. If it throws, no evaluation is open, and the call may be
    // repeated.
    void PreEvaluate(const em::Id& id);

    // Closes the evaluation: enqueues one release of the batch, after all reported events. In the
    // sync-object mode the OpenGL stream then waits for the releases, which requires that a context
    // of the renderer's share group is current.
    void PostEvaluate(const em::Id& id);

    // Makes one buffer usable by commands on `queue`. `*event` receives the event to wait for, with
    // a reference that the caller owns: that of the batch's acquire, or, for an unbatched buffer,
    // that of an acquire enqueued here. `event` may be null for an unbatched buffer. Returns
    // CL_INVALID_ARG_VALUE (-50) for a null or empty buffer, else the status of the acquire.
    int EnqueueAcquireSharedCLBuffer(cl_command_queue queue, const TopenCLSharedBuffer* buffer,
                                     cl_event* event);

    // Makes the batch's release wait for `events` and retains them. Returns the address of the
    // event of the batch's release, which is valid as long as the manager; the event there is null
    // from PreEvaluate to PostEvaluate. If batching is off, retains nothing. If it throws, the
    // events from the one that could not be listed on are not retained.
    const cl_event* EnqueueReleaseBatchedSharedCLBuffer(unsigned int numEvents,
                                                        const cl_event* events);

    // Enqueues the release of unbatched buffers. In the sync-object mode the next PostEvaluate
    // makes the OpenGL stream wait for `*event`, which the caller keeps alive until then. Returns
    // the status of the release.
    int EnqueueReleaseSharedCLBuffer(cl_command_queue queue, unsigned int numMemObjects,
                                     const cl_mem* memObjects, unsigned int numEvents,
                                     const cl_event* waitList, cl_event* event);

    // Called after the renderer has drawn. If the mode requires it, replaces the fence that the
    // next acquire waits for. Must not overlap with an acquire (PreEvaluate or
    // EnqueueAcquireSharedCLBuffer on any thread): while the fence is replaced, an acquire would
    // not wait for the drawing.
    void RenderingComplete();

private:
    void UpdateBufferBatch();
    void ReleaseBufferBatch();
    void AcquireBatch();
    [[nodiscard]] int DissolveBatch();
    void LeaveBatch(const TopenCLSharedBuffer& record);
    void ReleaseUnbatched(const TopenCLSharedBuffer& record);

    // The evaluation id if no evaluation is open.
    static constexpr std::uint16_t kNoEvaluation = 0xFFFE;

    std::unique_ptr<TopenCLSharedBufferMgrImpl> fImpl;
    std::vector<AutoCLObject<cl_mem>> fBatch;       // in the order of fBuffers at the last rebuild
    std::map<cl_mem, TopenCLSharedBuffer> fBuffers; // guarded by fImpl's mutex
    bool fBatchDirty = false;                       // fBuffers changed since the last rebuild
    AutoCLObject<cl_event> fAcquireEvent;           // of the last batch acquire
    std::uint16_t fEvaluationId = kNoEvaluation;    // of the open evaluation
    bool fBatchAcquired = false;                    // acquired and not yet released
    bool fBatchingEnabled = true;
    AutoCLObject<cl_event> fReleaseEvent; // of the last batch release
};
