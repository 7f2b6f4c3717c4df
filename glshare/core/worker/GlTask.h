// Tasks for a GlWorker's thread, and the queue that holds them. Queueing a task allocates nothing.
#pragma once

#include <memory>
#include <utility>

namespace glshare {

class GlBufferAccess;

class GlTask {
public:
    GlTask() = default;
    virtual ~GlTask() = default;

    GlTask(const GlTask&) = delete;
    GlTask& operator=(const GlTask&) = delete;

    // Runs on the worker's thread. `gl` is null once the worker has lost its OpenGL context; the
    // task then only completes what others wait for. Returns whether the task has finished; a
    // polled task that has not runs again.
    virtual bool run(GlBufferAccess* gl) noexcept = 0;

    // Called instead of a delete expression when a GlTaskPtr ends. The caller may not use the task
    // afterwards.
    virtual void dispose() noexcept { delete this; }

    struct Deleter {
        void operator()(GlTask* task) const noexcept { task->dispose(); }
    };

private:
    friend class GlTaskQueue;
    std::unique_ptr<GlTask, Deleter> fNext; // in the queue that owns the task
};

using GlTaskPtr = std::unique_ptr<GlTask, GlTask::Deleter>;

// A first-in, first-out queue that owns its tasks. Not synchronised.
class GlTaskQueue {
public:
    GlTaskQueue() = default;
    ~GlTaskQueue()
    {
        while (!empty())
            pop();
    }

    GlTaskQueue(const GlTaskQueue&) = delete;
    GlTaskQueue& operator=(const GlTaskQueue&) = delete;

    void swap(GlTaskQueue& other) noexcept
    {
        std::swap(fFirst, other.fFirst);
        std::swap(fLast, other.fLast);
    }

    [[nodiscard]] bool empty() const noexcept { return fFirst == nullptr; }

    void push(GlTaskPtr task) noexcept
    {
        GlTask* added = task.get();
        (empty() ? fFirst : fLast->fNext) = std::move(task);
        fLast = added;
    }

    // Removes the first task; the queue must not be empty.
    GlTaskPtr pop() noexcept
    {
        GlTaskPtr task = std::move(fFirst);
        fFirst = std::move(task->fNext);
        return task;
    }

private:
    GlTaskPtr fFirst;
    GlTask* fLast = nullptr; // unspecified if the queue is empty
};

} // namespace glshare
