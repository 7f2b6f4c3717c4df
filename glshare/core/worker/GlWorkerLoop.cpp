#include "core/worker/GlWorkerLoop.h"

#include "core/gl/LibraryFunctions.h"
#include "core/worker/Fork.h"

#include <chrono>
#include <utility>

namespace glshare {

namespace {

// Between two looks at what is watched: short beside a frame, long beside a look.
constexpr std::chrono::microseconds kWatchInterval{250};

// An exiting process waits this long for a job that is running, which is a copy at most.
constexpr std::chrono::seconds kExitPatience{1};

} // namespace

// The loops that were started and may still run.
struct GlWorker::Loop::Running {
    struct Entry {
        std::weak_ptr<Loop> loop;
        // Of a loop that stopped itself: nobody has joined the thread.
        std::shared_ptr<Loop> orphan;
        std::thread thread;
    };

    // Joins the threads that have ended, and drops entries without a loop. With `mutex` held.
    void tidy();

    std::mutex mutex; // guards the rest
    std::list<Entry> entries;
    bool isRegistered = false;

    // Never destroyed, as an exit handler uses it.
    static Running& get()
    {
        static auto* const theLoops = new Running;
        return *theLoops;
    }
};

GlWorker::Loop::Loop(std::unique_ptr<GlContext> context) : fContext(std::move(context)) {}

bool GlWorker::Loop::begin()
{
    if (!fContext->makeCurrent())
        return false;
    try {
        fDevice = GlDevice::create(fContext->resolver());
    } catch (...) {
        fContext->releaseCurrent();
        throw;
    }
    fHasGl = fDevice.has_value();
    if (!fHasGl)
        fContext->releaseCurrent();
    return fHasGl;
}

GlDevice* GlWorker::Loop::device()
{
    return fHasGl ? &*fDevice : nullptr;
}

void GlWorker::Loop::run()
{
    Lock lock(fMutex);
    for (;;) {
        if (fIsExiting)
            fChanged.wait(lock, [] { return false; });
        if (fIsDisplayClosing && fHasGl)
            letGoOfDisplay(lock);
        if (!fTasks.empty()) {
            runTask(lock);
        } else if (fIsStopping && !fIsExiting) {
            break;
        } else if (!fWatched.empty()) {
            lookAtWatched(lock);
        } else {
            fChanged.wait(lock);
        }
    }
    fIsEnding = true;
    fIsBusy = true;
    lock.unlock();
    if (fHasGl.exchange(false)) {
        fDevice->destroy();
        fContext->releaseCurrent();
    }
    while (!fWatched.empty())
        fWatched.pop()->run(nullptr);
    fContext.reset();
    lock.lock();
    fIsBusy = false;
    fChanged.notify_all();
}

// The task is dropped before the lock is taken again: it may be the last owner of its worker.
void GlWorker::Loop::runTask(Lock& lock)
{
    fCurrent = fTasks.pop();
    fIsBusy = true;
    lock.unlock();
    fCurrent->run(device());
    fCurrent = nullptr;
    lock.lock();
    fIsBusy = false;
    fChanged.notify_all();
}

void GlWorker::Loop::lookAtWatched(Lock& lock)
{
    fWatched.swap(fUnseen);
    fMustLookNow = false;
    fIsBusy = true;
    lock.unlock();
    while (!fUnseen.empty()) {
        fCurrent = fUnseen.pop();
        if (fCurrent->run(device()))
            fCurrent = nullptr;
        else
            fSeen.push(std::move(fCurrent));
    }
    lock.lock();
    fIsBusy = false;
    fChanged.notify_all();
    // Tasks that were added during the look follow after the earlier ones.
    fWatched.swap(fSeen);
    while (!fSeen.empty())
        fWatched.push(fSeen.pop());
    fChanged.wait_for(lock, kWatchInterval, [this] {
        return fWatched.empty() || fMustLookNow || !fTasks.empty() || fIsStopping || fIsExiting ||
               (fIsDisplayClosing && fHasGl);
    });
}

void GlWorker::Loop::letGoOfDisplay(Lock& lock)
{
    lock.unlock();
    fDevice->destroy();
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

void GlWorker::Loop::watch(GlTaskPtr task) noexcept
{
    const std::scoped_lock lock(fMutex);
    fWatched.push(std::move(task));
    fMustLookNow = true;
    fChanged.notify_all();
}

// Nobody waits for the list of loops here, which may be held by a thread that waits for this one;
// the loops look at short intervals anyway.
void GlWorker::Loop::lookNow() noexcept
{
    Running& running = Running::get();
    const std::unique_lock lock(running.mutex, std::try_to_lock);
    if (!lock)
        return;
    for (const Running::Entry& entry : running.entries) {
        const std::shared_ptr<Loop> loop = entry.loop.lock();
        if (loop == nullptr)
            continue;
        const std::scoped_lock loopLock(loop->fMutex);
        loop->fMustLookNow = true;
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

void GlWorker::Loop::markGone()
{
    const std::scoped_lock lock(fMutex);
    fIsGone = true;
    fChanged.notify_all();
}

void GlWorker::Loop::Running::tidy()
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

void GlWorker::Loop::adopt(std::shared_ptr<Loop> loop, std::thread thread) noexcept
{
    Running& running = Running::get();
    const std::scoped_lock lock(running.mutex);
    running.tidy();
    for (Running::Entry& entry : running.entries) {
        if (entry.loop.lock() != loop)
            continue;
        entry.orphan = std::move(loop);
        entry.thread = std::move(thread);
        return;
    }
}

bool GlWorker::Loop::callerSharesObjects() const
{
    return fHasGl && fContext->callerHasContext() && fDevice->callerSharesObjects();
}

void GlWorker::Loop::finishCaller() const
{
    fDevice->finishCaller();
}

GlDevice::CallerLook GlWorker::Loop::lookFromCaller() const
{
    return GlDevice::CallerLook(*fDevice);
}

void GlWorker::Loop::leaveDisplay()
{
    Lock lock(fMutex);
    fIsDisplayClosing = true;
    fChanged.notify_all();
    fChanged.wait(lock, [this] { return (!fHasGl && !fIsBusy) || fIsExiting; });
}

// A thread that is ending is waited for until it is gone; any other stays where it is.
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
    fChanged.wait_for(lock, kExitPatience, [this] { return !fIsBusy && (!fIsEnding || fIsGone); });
}

void GlWorker::Loop::listenForDisplay(const std::shared_ptr<Loop>& loop)
{
    loop->fContext->onDisplayClosing([weak = std::weak_ptr<Loop>(loop)] {
        if (const std::shared_ptr<Loop> open = weak.lock())
            open->leaveDisplay();
    });
}

void GlWorker::Loop::listenForExit(const std::shared_ptr<Loop>& loop)
{
    Running& running = Running::get();
    const std::scoped_lock lock(running.mutex);
    running.tidy();
    running.entries.push_back({loop, nullptr, {}});
    if (!std::exchange(running.isRegistered, true))
        callAtExit(parkAll);
}

// In a forked child there are no threads to park.
void GlWorker::Loop::parkAll()
{
    if (isForkedChild())
        return;
    Running& running = Running::get();
    const std::scoped_lock lock(running.mutex);
    for (Running::Entry& entry : running.entries) {
        if (entry.orphan != nullptr)
            entry.orphan->park(&entry.thread);
        else if (const std::shared_ptr<Loop> loop = entry.loop.lock())
            loop->park(nullptr);
    }
}

} // namespace glshare
