// A thread with an OpenGL context of its own, which does the GL side's share of the work. It never
// waits for OpenCL, so that anybody may wait for it.
#pragma once

#include "core/GlContext.h"
#include "core/GlDevice.h"

#include <functional>
#include <list>
#include <memory>
#include <thread>

namespace glshare {

class GlWorker {
public:
    // Work on the worker's thread; gets null once the GL side is gone, and must then only tell
    // those who wait.
    using Job = std::function<void(GlDevice* device)>;

    // A job that is asked again and again, at short intervals, until it answers true.
    using Watch = std::function<bool(GlDevice* device)>;

    // One job or watch that was made in advance: passing it to the worker allocates nothing.
    using PreparedJob = std::list<Job>;
    using PreparedWatch = std::list<Watch>;

    // Starts the thread on `context`; null if the context cannot be used. Throws std::system_error
    // if the system creates no thread.
    [[nodiscard]] static std::unique_ptr<GlWorker> start(std::unique_ptr<GlContext> context);

    // Stops. Any thread, the worker's own included, where the last owner may be a job.
    ~GlWorker();

    GlWorker(const GlWorker&) = delete;
    GlWorker& operator=(const GlWorker&) = delete;

    // Jobs run in the order given. Any thread. A job must not throw.
    void post(Job job);
    void post(PreparedJob job) noexcept;

    // The same, and returns when the job has run; throws what the job throws. Not on the worker's
    // thread.
    void call(const Job& job);

    // A watch must not throw.
    void watch(Watch watch);
    void watch(PreparedWatch watch) noexcept;

    // Whether the calling thread has a current context of this share group. Any thread.
    [[nodiscard]] bool callerSharesObjects() const;

    // Waits for what was drawn on the context that is current on the calling thread.
    void finishCaller() const;

private:
    class Loop;

    explicit GlWorker(std::shared_ptr<Loop> loop);

    // Ends the loop; returns when the thread uses the context no more.
    void stop();

    std::shared_ptr<Loop> loop_; // the thread's own; it holds a reference too
    std::thread thread_;
};

} // namespace glshare
