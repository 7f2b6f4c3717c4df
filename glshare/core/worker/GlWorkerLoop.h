// The part of GlWorker that runs on its thread.
#pragma once

#include "core/worker/GlWorker.h"

#include <atomic>
#include <condition_variable>
#include <list>
#include <mutex>
#include <optional>
#include <thread>

namespace glshare {

// Shared by the GlWorker and its thread. It outlives the GlWorker if that is destroyed on its own
// thread or in a process that is exiting.
class GlWorker::Loop {
public:
    explicit Loop(std::unique_ptr<GlContext> context) noexcept;

    // The worker's thread: makes the context current; returns false if it cannot be used.
    [[nodiscard]] bool makeCurrent();

    // The worker's thread: runs tasks until requestStop, then the posted tasks that are left, and
    // releases the context.
    void run();

    // The following: any thread.

    void post(GlTaskPtr task) noexcept;
    void poll(GlTaskPtr task) noexcept;
    static void pollNow() noexcept;

    // Sets `hasRun`, after which the waiting thread may destroy its call; and waits for it.
    void endCall(bool& hasRun) noexcept;
    void waitForCall(const bool& hasRun);

    // Returns false if the thread will not end, since the process is exiting.
    [[nodiscard]] bool requestStop();
    // Called after the thread was joined.
    void markJoined();
    // Takes ownership of a thread that has called requestStop for its own loop; another thread
    // joins it. The loop must be registered for exit.
    static void joinLater(std::shared_ptr<Loop> loop, std::thread thread) noexcept;

    [[nodiscard]] bool isCallerInShareGroup() const;
    void finishCaller() const;
    [[nodiscard]] GlBufferAccess::CallerAccess callerAccess() const;

    // Abandons the context when its display closes.
    static void handleDisplayClosing(const std::shared_ptr<Loop>& loop);
    // Parks the thread when the process exits. The drivers' exit handlers must not run while it
    // uses them, nor while it ends, which frees the drivers' thread-local data.
    static void registerForExit(const std::shared_ptr<Loop>& loop);

private:
    struct RunningLoops;
    using Lock = std::unique_lock<std::mutex>;

    void closeDisplay();
    void park(std::thread* orphan);
    static void parkAll();

    // Called with the lock held; unlock while tasks and drivers run.
    void runTask(Lock& lock);
    void pollTasks(Lock& lock);
    void abandonContext(Lock& lock);
    // Returns null once the context is lost.
    [[nodiscard]] GlBufferAccess* gl() noexcept;

    std::unique_ptr<GlContext> fContext;
    std::optional<GlBufferAccess> fGl; // not changed after makeCurrent
    std::atomic<bool> fHasGl{false};

    // The worker's thread only: the polled tasks during a pass, and the current task. No task is on
    // the thread's stack, which a forked child lacks.
    GlTaskQueue fToPoll;
    GlTaskQueue fToPollAgain;
    GlTaskPtr fCurrent;

    std::mutex fMutex; // guards everything below
    std::condition_variable fChanged;
    GlTaskQueue fTasks;
    GlTaskQueue fPolled;
    bool fMustPollNow = false;
    bool fIsBusy = false;
    bool fIsStopping = false;
    bool fIsEnding = false; // run() is returning or has returned
    bool fIsJoined = false;
    bool fIsDisplayClosing = false;
    bool fIsExiting = false;
};

} // namespace glshare
