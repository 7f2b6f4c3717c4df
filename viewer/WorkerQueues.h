// The command queues of the threads that deform.
#pragma once

#include "buffers/TopenCLDataBufferPool.h"
#include "viewer/CommandTimeline.h"
#include "viewer/OpenCLFunctions.h"

#include <memory>
#include <unordered_set>
#include <vector>

#include <CL/cl.h>
#include <tbb/task_arena.h>

namespace viewer {

// A queue with a pool of memory for what passes between the deformers of a mesh.
//
// The queue works in order and the pool's memory is used on this queue only. So memory may go back
// to the pool as soon as its last user is enqueued: the next one is enqueued behind it. One thread
// at a time uses an object.
class WorkerQueue {
public:
    // Takes over the queue. `timeline` shows its commands, or is null.
    WorkerQueue(const OpenCLFunctions& cl, cl_command_queue queue,
                std::unique_ptr<CommandTimeline> timeline);
    ~WorkerQueue();
    WorkerQueue(const WorkerQueue&) = delete;
    WorkerQueue& operator=(const WorkerQueue&) = delete;

    cl_command_queue queue() const { return fQueue; }

    // As TopenCLDataBufferPool::createOutputBuffer, and counts.
    TopenCLDataBuffer createOutputBuffer(const TopenCLDataBuffer& input, const Tplug& plug);
    void releaseBuffers() { fPool.releaseBuffers(); }

    // Notes a command of this queue for the trace, if there is one. `name` is borrowed until
    // recordCommands(), which waits for the commands.
    void trace(const char* name, const AutoCLObject<cl_event>& event);
    void recordCommands();

    // Of the buffers from the pool: those with memory that it made, and those it had already.
    std::size_t buffersCreated() const { return fSeen.size(); }
    std::size_t buffersReused() const { return fReused; }

private:
    const OpenCLFunctions& fCL;
    cl_command_queue fQueue;
    TopenCLDataBufferPool fPool;
    std::unique_ptr<CommandTimeline> fTimeline;
    std::unordered_set<cl_mem> fSeen; // the pool keeps all of them alive
    std::size_t fReused = 0;
};

// One queue for each thread of the arena in which meshes are deformed.
class WorkerQueues {
public:
    explicit WorkerQueues(const OpenCLFunctions& cl);

    // Waits for all commands and puts them on the host's timeline, where that is sampled.
    void recordCommands();

    // Every thread that works in this arena has a queue.
    tbb::task_arena& arena() { return fArena; }
    // Null when the queues could not be made.
    bool valid() const { return !fQueues.empty(); }
    // The calling thread's, which works in the arena.
    WorkerQueue& forThisThread();
    const std::vector<std::unique_ptr<WorkerQueue>>& all() const { return fQueues; }

private:
    bool addQueue(const OpenCLFunctions& cl);

    tbb::task_arena fArena;
    std::vector<std::unique_ptr<WorkerQueue>> fQueues; // by the thread's index in the arena
};

} // namespace viewer
