// What runs on a worker's thread; part of GlWorker. It outlives the GlWorker where that ends on its
// own thread or in a process that is exiting.
#pragma once

#include "core/worker/GlWorker.h"

#include <atomic>
#include <condition_variable>
#include <list>
#include <mutex>
#include <optional>
#include <thread>

namespace glshare {

class GlWorker::Loop {
public:
    explicit Loop(std::unique_ptr<GlContext> context);

    // On the worker's thread: takes the context; false if it cannot be used.
    [[nodiscard]] bool begin();

    // On the worker's thread: works until requestStop, and then until nothing is left to do.
    void run();

    // The following on any thread.

    void post(GlTaskPtr task) noexcept;
    void watch(GlTaskPtr task) noexcept;
    static void lookNow() noexcept;

    // Sets `hasRun`, which belongs to a call that may be gone on return; waits until it is set.
    void endCall(bool& hasRun) noexcept;
    void waitForCall(const bool& hasRun);

    // False if the thread will not end any more, since the process is exiting.
    [[nodiscard]] bool requestStop();
    // Says that the thread, asked to stop, has been joined.
    void markGone();
    // Takes over the thread of a loop that was asked to stop by itself: somebody has to join it.
    // listenForExit has been called for the loop.
    static void adopt(std::shared_ptr<Loop> loop, std::thread thread) noexcept;

    [[nodiscard]] bool callerSharesObjects() const;
    void finishCaller() const;
    [[nodiscard]] GlDevice::CallerLook lookFromCaller() const;

    // Lets go of the GL side when its display closes, and parks the thread when the process exits:
    // the exit handlers of the drivers must not run beside a thread that uses them, nor beside one
    // that ends, which gives back what the drivers keep for it.
    static void listenForDisplay(const std::shared_ptr<Loop>& loop);
    static void listenForExit(const std::shared_ptr<Loop>& loop);

private:
    struct Running;
    using Lock = std::unique_lock<std::mutex>;

    void leaveDisplay();
    void park(std::thread* orphan);
    static void parkAll();

    // With the lock held; the lock is given up while foreign code runs.
    void runTask(Lock& lock);
    void lookAtWatched(Lock& lock);
    void letGoOfDisplay(Lock& lock);
    [[nodiscard]] GlDevice* device();

    std::unique_ptr<GlContext> fContext;
    std::optional<GlDevice> fDevice; // unchanged once begin has returned
    std::atomic<bool> fHasGl{false};

    // The worker's thread alone: what it has taken from `fWatched`, and the task that runs. No task
    // is on the thread's stack, which a forked child does not have.
    GlTaskQueue fUnseen;
    GlTaskQueue fSeen;
    GlTaskPtr fCurrent;

    std::mutex fMutex; // guards everything below
    std::condition_variable fChanged;
    GlTaskQueue fTasks;
    GlTaskQueue fWatched;
    bool fMustLookNow = false;
    bool fIsBusy = false;
    bool fIsStopping = false;
    bool fIsEnding = false; // run is over, or nearly
    bool fIsGone = false;   // and the thread with it
    bool fIsDisplayClosing = false;
    bool fIsExiting = false;
};

} // namespace glshare
