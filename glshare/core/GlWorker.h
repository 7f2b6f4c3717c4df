// A thread with an OpenGL context of its own, which does the GL side's share of the work. It never
// waits for OpenCL, so that anybody may wait for it.
#pragma once

#include "core/GlContext.h"
#include "core/GlDevice.h"

#include <functional>
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

    // Starts the thread on `context`; null if the context cannot be used.
    [[nodiscard]] static std::unique_ptr<GlWorker> start(std::unique_ptr<GlContext> context);

    // Stops. Any thread, the worker's own included, where the last owner may be a job.
    ~GlWorker();

    GlWorker(const GlWorker&) = delete;
    GlWorker& operator=(const GlWorker&) = delete;

    // Jobs run in the order given. Any thread.
    void post(Job job);

    // The same, and returns when the job has run. Not on the worker's thread.
    void call(const Job& job);

    void watch(Watch watch);

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
