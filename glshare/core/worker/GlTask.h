// A piece of work for a worker's thread, and the queue that holds such work. Passing a task on
// allocates nothing.
#pragma once

#include <memory>
#include <utility>

namespace glshare {

class GlDevice;

class GlTask {
public:
    GlTask() = default;
    virtual ~GlTask() = default;

    GlTask(const GlTask&) = delete;
    GlTask& operator=(const GlTask&) = delete;

    // Works on the worker's thread. `device` is null once the GL side is gone: then all that is
    // left to do is to complete what others wait for. Returns whether the work has ended; a task
    // that is watched runs again at short intervals until it has.
    virtual bool run(GlDevice* device) noexcept = 0;

    // What a GlTaskPtr does at its end. Nothing may be done with the task afterwards.
    virtual void drop() noexcept { delete this; }

    struct Drop {
        void operator()(GlTask* task) const noexcept { task->drop(); }
    };

private:
    friend class GlTaskQueue;
    std::unique_ptr<GlTask, Drop> fNext; // in the queue that owns the task
};

using GlTaskPtr = std::unique_ptr<GlTask, GlTask::Drop>;

// First in, first out. Not synchronised.
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

    [[nodiscard]] bool empty() const { return fFirst == nullptr; }

    void push(GlTaskPtr task) noexcept
    {
        GlTask* const added = task.get();
        (empty() ? fFirst : fLast->fNext) = std::move(task);
        fLast = added;
    }

    // Takes the first; the queue must not be empty.
    GlTaskPtr pop() noexcept
    {
        GlTaskPtr task = std::move(fFirst);
        fFirst = std::move(task->fNext);
        return task;
    }

private:
    GlTaskPtr fFirst;
    GlTask* fLast = nullptr; // valid unless the queue is empty
};

} // namespace glshare
