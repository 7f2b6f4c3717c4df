#include "core/worker/GlWorkerLoop.h"

#include "core/worker/ProcessHooks.h"

#include <chrono>
#include <utility>

namespace glshare {

namespace {

// Between two passes over the polled tasks: short compared with a frame, long compared with a pass.
constexpr std::chrono::microseconds kPollInterval{250};

// How long an exiting process waits for the current task, which is a copy at most.
constexpr std::chrono::seconds kExitTimeout{1};

} // namespace

// The loops of the process that may still run.
struct GlWorker::Loop::RunningLoops {
    struct Entry {
        std::weak_ptr<Loop> loop;
        // Set for a loop that was stopped on its own thread, which has to be joined here.
        std::shared_ptr<Loop> orphan;
        std::thread thread;
    };

    // Joins orphans that have ended, and removes entries without a loop. Called with `mutex` held.
    void removeEnded();

    std::mutex mutex; // guards the rest
    std::list<Entry> entries;
    bool isRegistered = false;

    // Never destroyed: an exit handler uses it.
    static RunningLoops& get()
    {
        static auto* const theLoops = new RunningLoops;
        return *theLoops;
    }
};

GlWorker::Loop::Loop(std::unique_ptr<GlContext> context) noexcept : fContext(std::move(context)) {}

bool GlWorker::Loop::makeCurrent()
{
    if (!fContext->makeCurrent())
        return false;
    try {
        fGl = GlBufferAccess::create(fContext->resolver());
    } catch (...) {
        fContext->releaseCurrent();
        throw;
    }
    fHasGl = fGl.has_value();
    if (!fHasGl)
        fContext->releaseCurrent();
    return fHasGl;
}

GlBufferAccess* GlWorker::Loop::gl() noexcept
{
    return fHasGl ? &*fGl : nullptr;
}

void GlWorker::Loop::run()
{
    Lock lock(fMutex);
    for (;;) {
        if (fIsExiting)
            fChanged.wait(lock, [] { return false; });
        if (fIsDisplayClosing && fHasGl)
            abandonContext(lock);
        if (!fTasks.empty()) {
            runTask(lock);
        } else if (fIsStopping && !fIsExiting) {
            break;
        } else if (!fPolled.empty()) {
            pollTasks(lock);
        } else {
            fChanged.wait(lock);
        }
    }
    fIsEnding = true;
    fIsBusy = true;
    lock.unlock();
    if (fHasGl.exchange(false)) {
        fGl->destroy();
        fContext->releaseCurrent();
    }
    fContext.reset();
    lock.lock();
    fIsBusy = false;
    fChanged.notify_all();
}

// Disposes of the task before it locks again, since the task may be the last owner of the worker.
void GlWorker::Loop::runTask(Lock& lock)
{
    fCurrent = fTasks.pop();
    fIsBusy = true;
    lock.unlock();
    fCurrent->run(gl());
    fCurrent = nullptr;
    lock.lock();
    fIsBusy = false;
    fChanged.notify_all();
}

void GlWorker::Loop::pollTasks(Lock& lock)
{
    fPolled.swap(fToPoll);
    fMustPollNow = false;
    fIsBusy = true;
    lock.unlock();
    while (!fToPoll.empty()) {
        fCurrent = fToPoll.pop();
        if (fCurrent->run(gl()))
            fCurrent = nullptr;
        else
            fToPollAgain.push(std::move(fCurrent));
    }
    lock.lock();
    fIsBusy = false;
    fChanged.notify_all();
    // Keeps the order: tasks added during the pass come last.
    fPolled.swap(fToPollAgain);
    while (!fToPollAgain.empty())
        fPolled.push(fToPollAgain.pop());
    fChanged.wait_for(lock, kPollInterval, [this] {
        return fPolled.empty() || fMustPollNow || !fTasks.empty() || fIsStopping || fIsExiting ||
               (fIsDisplayClosing && fHasGl);
    });
}

void GlWorker::Loop::abandonContext(Lock& lock)
{
    lock.unlock();
    fGl->destroy();
    fContext->releaseCurrent();
    fContext->abandon();
    lock.lock();
    fHasGl = false;
    fChanged.notify_all();
}

void GlWorker::Loop::post(GlTaskPtr task) noexcept
{
    {
        const std::scoped_lock lock(fMutex);
        if (!fIsExiting) {
            fTasks.push(std::move(task));
            fChanged.notify_all();
            return;
        }
    }
    task->run(nullptr);
}

void GlWorker::Loop::poll(GlTaskPtr task) noexcept
{
    const std::scoped_lock lock(fMutex);
    fPolled.push(std::move(task));
    fMustPollNow = true;
    fChanged.notify_all();
}

// Returns if the list is locked, possibly by a thread that waits for this one: the loops poll again
// after the interval.
void GlWorker::Loop::pollNow() noexcept
{
    RunningLoops& running = RunningLoops::get();
    const std::unique_lock lock(running.mutex, std::try_to_lock);
    if (!lock)
        return;
    for (const RunningLoops::Entry& entry : running.entries) {
        const std::shared_ptr<Loop> loop = entry.loop.lock();
        if (loop == nullptr)
            continue;
        const std::scoped_lock loopLock(loop->fMutex);
        loop->fMustPollNow = true;
        loop->fChanged.notify_all();
    }
}

void GlWorker::Loop::endCall(bool& hasRun) noexcept
{
    const std::scoped_lock lock(fMutex);
    hasRun = true;
    fChanged.notify_all();
}

void GlWorker::Loop::waitForCall(const bool& hasRun)
{
    Lock lock(fMutex);
    fChanged.wait(lock, [&hasRun] { return hasRun; });
}

bool GlWorker::Loop::requestStop()
{
    const std::scoped_lock lock(fMutex);
    fIsStopping = true;
    fChanged.notify_all();
    return !fIsExiting;
}

void GlWorker::Loop::markJoined()
{
    const std::scoped_lock lock(fMutex);
    fIsJoined = true;
    fChanged.notify_all();
}

void GlWorker::Loop::RunningLoops::removeEnded()
{
    std::erase_if(entries, [](Entry& entry) {
        if (entry.orphan == nullptr)
            return entry.loop.expired();
        const std::scoped_lock lock(entry.orphan->fMutex);
        const bool hasRun = entry.orphan->fIsEnding && !entry.orphan->fIsBusy;
        if (hasRun)
            entry.thread.join();
        return hasRun;
    });
}

void GlWorker::Loop::joinLater(std::shared_ptr<Loop> loop, std::thread thread) noexcept
{
    RunningLoops& running = RunningLoops::get();
    const std::scoped_lock lock(running.mutex);
    running.removeEnded();
    for (RunningLoops::Entry& entry : running.entries) {
        if (entry.loop.lock() != loop)
            continue;
        entry.orphan = std::move(loop);
        entry.thread = std::move(thread);
        return;
    }
}

bool GlWorker::Loop::isCallerInShareGroup() const
{
    return fHasGl && fContext->callerHasContext() && fGl->isCallerInShareGroup();
}

void GlWorker::Loop::finishCaller() const
{
    fGl->finishCaller();
}

GlBufferAccess::CallerAccess GlWorker::Loop::callerAccess() const
{
    return GlBufferAccess::CallerAccess(*fGl);
}

void GlWorker::Loop::closeDisplay()
{
    Lock lock(fMutex);
    fIsDisplayClosing = true;
    fChanged.notify_all();
    fChanged.wait(lock, [this] { return (!fHasGl && !fIsBusy) || fIsExiting; });
}

// Waits for the end of a thread that is ending already; any other thread stays parked in run().
void GlWorker::Loop::park(std::thread* orphan)
{
    Lock lock(fMutex);
    fIsExiting = true;
    fChanged.notify_all();
    if (orphan != nullptr && fIsEnding) {
        lock.unlock();
        orphan->join();
        return;
    }
    fChanged.wait_for(lock, kExitTimeout, [this] { return !fIsBusy && (!fIsEnding || fIsJoined); });
}

void GlWorker::Loop::handleDisplayClosing(const std::shared_ptr<Loop>& loop)
{
    loop->fContext->onDisplayClosing([weak = std::weak_ptr<Loop>(loop)] {
        if (const std::shared_ptr<Loop> open = weak.lock())
            open->closeDisplay();
    });
}

void GlWorker::Loop::registerForExit(const std::shared_ptr<Loop>& loop)
{
    RunningLoops& running = RunningLoops::get();
    const std::scoped_lock lock(running.mutex);
    running.removeEnded();
    running.entries.push_back({loop, nullptr, {}});
    if (!std::exchange(running.isRegistered, true))
        callAtExit(parkAll);
}

// A forked child has no threads to park.
void GlWorker::Loop::parkAll()
{
    if (isForkedChild())
        return;
    RunningLoops& running = RunningLoops::get();
    const std::scoped_lock lock(running.mutex);
    for (RunningLoops::Entry& entry : running.entries) {
        if (entry.orphan != nullptr)
            entry.orphan->park(&entry.thread);
        else if (const std::shared_ptr<Loop> loop = entry.loop.lock())
            loop->park(nullptr);
    }
}

} // namespace glshare
