#include "viewer/WorkerQueues.h"

#include "host/Profiler.h"
#include "runtime/TopenCLInfo.h"

#include <string>
#include <utility>

namespace viewer {

namespace {

// A queue of the library's own kind; while the profiler samples, one that notes when its commands
// run.
cl_command_queue createQueue(const OpenCLFunctions& cl)
{
    TopenCLInfo& info = TopenCLInfo::theOne();
    if (!profiler::samplingActive())
        return info.createOpenCLCommandQueue(nullptr);
    return cl.clCreateCommandQueue(info.openCLContext(), info.openCLDevice(),
                                   CL_QUEUE_PROFILING_ENABLE, nullptr);
}

} // namespace

WorkerQueue::WorkerQueue(const OpenCLFunctions& cl, cl_command_queue queue,
                         std::unique_ptr<CommandTimeline> timeline)
    : fCL(cl), fQueue(queue), fTimeline(std::move(timeline))
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

void WorkerQueue::trace(const char* name, const AutoCLObject<cl_event>& event)
{
    if (fTimeline)
        fTimeline->add(name, event);
}

void WorkerQueue::recordCommands()
{
    if (fTimeline)
        fTimeline->record();
}

WorkerQueues::WorkerQueues(const OpenCLFunctions& cl)
{
    fArena.initialize();
    for (int i = 0; i < fArena.max_concurrency(); ++i) {
        if (!addQueue(cl)) {
            fQueues.clear();
            return;
        }
    }
}

bool WorkerQueues::addQueue(const OpenCLFunctions& cl)
{
    cl_command_queue queue = createQueue(cl);
    if (!queue)
        return false;
    std::unique_ptr<CommandTimeline> timeline;
    if (profiler::samplingActive())
        timeline = std::make_unique<CommandTimeline>(
            cl, queue, "OpenCL queue " + std::to_string(fQueues.size() + 1));
    fQueues.push_back(std::make_unique<WorkerQueue>(cl, queue, std::move(timeline)));
    return true;
}

void WorkerQueues::recordCommands()
{
    for (const auto& worker : fQueues)
        worker->recordCommands();
}

WorkerQueue& WorkerQueues::forThisThread()
{
    const int index = tbb::this_task_arena::current_thread_index();
    return *fQueues[static_cast<std::size_t>(index)];
}

} // namespace viewer
