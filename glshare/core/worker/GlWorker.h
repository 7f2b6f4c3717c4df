// A thread with a current OpenGL context, on which glshare makes its OpenGL calls. One per OpenCL
// context that shares. No other thread ever makes a context of glshare's current.
#pragma once

#include "core/gl/GlBufferAccess.h"
#include "core/gl/GlContext.h"
#include "core/worker/GlTask.h"

#include <exception>
#include <memory>
#include <thread>

namespace glshare {

// Owns the thread, and through it the context. The thread never waits for OpenCL, so that any
// thread may wait for it.
class GlWorker {
public:
    // Starts the thread, which makes `context` current. Returns null if that fails or if its OpenGL
    // version is too old. Throws std::system_error if the system creates no thread.
    [[nodiscard]] static std::unique_ptr<GlWorker> start(std::unique_ptr<GlContext> context);

    // Finishes the posted tasks, then ends the thread. Any thread, also the worker's own if the
    // last owner is a task.
    ~GlWorker();

    GlWorker(const GlWorker&) = delete;
    GlWorker& operator=(const GlWorker&) = delete;

    // Runs a task once. Posted tasks run in order. Any thread.
    void post(GlTaskPtr task) noexcept;

    // Runs a task at short intervals until it has finished. The task must keep the worker alive
    // until then. Any thread.
    void poll(GlTaskPtr task) noexcept;

    // Makes all workers of the process run their polled tasks without waiting for the interval. Any
    // thread.
    static void pollNow() noexcept;

    // Calls job(gl) on the worker's thread, as GlTask::run is called, and waits for it. Throws what
    // the job throws. Any thread but the worker's.
    template <typename Job>
    void call(Job&& job)
    {
        struct JobCall final : Call {
            explicit JobCall(Job& work) : job(work) {}
            void work(GlBufferAccess* gl) override { job(gl); }
            Job& job;
        } call(job);
        run(call);
    }

    // Returns whether the calling thread's current context belongs to the worker's share group;
    // false if it has none. Any thread.
    [[nodiscard]] bool isCallerInShareGroup() const;

    // Waits for the OpenGL commands of the calling thread. Requires isCallerInShareGroup().
    void finishCaller() const;

    // Returns access through the calling thread's context. Requires isCallerInShareGroup().
    [[nodiscard]] GlBufferAccess::CallerAccess callerAccess() const;

private:
    class Loop;

    // A task that a thread waits for and owns.
    class Call : public GlTask {
    public:
        virtual void work(GlBufferAccess* gl) = 0;
        bool run(GlBufferAccess* gl) noexcept final;
        void dispose() noexcept final; // wakes the waiting thread

        Loop* loop = nullptr;
        std::exception_ptr thrown;
        bool hasRun = false; // guarded by the loop
    };

    explicit GlWorker(std::shared_ptr<Loop> loop) noexcept;

    void run(Call& call);

    // Returns when the thread no longer uses the context.
    void stop();

    std::shared_ptr<Loop> fLoop; // shared with the thread
    std::thread fThread;
};

} // namespace glshare
