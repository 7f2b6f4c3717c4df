#include "viewer/WorkerQueues.h"

#include "runtime/TopenCLInfo.h"

namespace viewer {

WorkerQueue::WorkerQueue(const OpenCLFunctions& cl, cl_command_queue queue) : fCL(cl), fQueue(queue)
{
}

WorkerQueue::~WorkerQueue()
{
    // The pool's memory goes with this object: nothing may use it any more.
    fCL.clFinish(fQueue);
    fCL.clReleaseCommandQueue(fQueue);
}

TopenCLDataBuffer WorkerQueue::createOutputBuffer(const TopenCLDataBuffer& input, const Tplug& plug)
{
    TopenCLDataBuffer output = fPool.createOutputBuffer(input, plug);
    if (input.descriptor().isReadOnly() && output.buffer().get()) {
        const bool isNew = fSeen.insert(output.buffer().get()).second;
        fReused += isNew ? 0 : 1;
    }
    return output;
}

WorkerQueues::WorkerQueues(const OpenCLFunctions& cl)
{
    fArena.initialize();
    for (int i = 0; i < fArena.max_concurrency(); ++i) {
        cl_command_queue queue = TopenCLInfo::theOne().createOpenCLCommandQueue(nullptr);
        if (!queue) {
            fQueues.clear();
            return;
        }
        fQueues.push_back(std::make_unique<WorkerQueue>(cl, queue));
    }
}

WorkerQueue& WorkerQueues::forThisThread()
{
    const int index = tbb::this_task_arena::current_thread_index();
    return *fQueues[static_cast<std::size_t>(index)];
}

} // namespace viewer
