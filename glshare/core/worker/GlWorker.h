// A thread with an OpenGL context of its own, which does the GL side's share of the work. It never
// waits for OpenCL, so that anybody may wait for it.
#pragma once

#include "core/gl/GlContext.h"
#include "core/gl/GlDevice.h"
#include "core/worker/GlTask.h"

#include <exception>
#include <memory>
#include <thread>

namespace glshare {

class GlWorker {
public:
    // Starts the thread on `context`; null if the context cannot be used. Throws std::system_error
    // if the system creates no thread.
    [[nodiscard]] static std::unique_ptr<GlWorker> start(std::unique_ptr<GlContext> context);

    // Stops. Any thread, the worker's own included, where the last owner may be a task.
    ~GlWorker();

    GlWorker(const GlWorker&) = delete;
    GlWorker& operator=(const GlWorker&) = delete;

    // Runs the task once. Tasks run in the order given. Any thread.
    void post(GlTaskPtr task) noexcept;

    // Runs the task at short intervals until it has ended. Any thread.
    void watch(GlTaskPtr task) noexcept;

    // Has every worker of the process look at once at what it watches. Any thread.
    static void lookNow() noexcept;

    // Calls job(device) on the worker's thread, as a task would be run; returns when it has
    // returned, and throws what it throws. Not on the worker's thread.
    template <typename Job>
    void call(Job&& job)
    {
        struct JobCall final : Call {
            explicit JobCall(Job& work) : job(work) {}
            void work(GlDevice* device) override { job(device); }
            Job& job;
        } call(job);
        run(call);
    }

    // Whether the calling thread has a current context of this share group. Any thread.
    [[nodiscard]] bool callerSharesObjects() const;

    // Waits for what was drawn on the context that is current on the calling thread.
    void finishCaller() const;

    // Looks at buffers with the context that is current on the calling thread.
    [[nodiscard]] GlDevice::CallerLook lookFromCaller() const;

private:
    class Loop;

    // A job with somebody who waits for it, and owns it.
    class Call : public GlTask {
    public:
        virtual void work(GlDevice* device) = 0;
        bool run(GlDevice* device) noexcept final;
        void drop() noexcept final; // lets the caller go on

        Loop* loop = nullptr;
        std::exception_ptr thrown;
        bool hasRun = false; // guarded by the loop
    };

    explicit GlWorker(std::shared_ptr<Loop> loop);

    void run(Call& call);

    // Ends the loop; returns when the thread uses the context no more.
    void stop();

    std::shared_ptr<Loop> fLoop; // the thread's own; it holds a reference too
    std::thread fThread;
};

} // namespace glshare
