#include "core/GlWorkerLoop.h"

#include "core/Fork.h"
#include "core/LibraryFunctions.h"

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

GlWorker::Loop::Loop(std::unique_ptr<GlContext> context) : context_(std::move(context)) {}

bool GlWorker::Loop::begin()
{
    if (!context_->makeCurrent())
        return false;
    try {
        device_ = GlDevice::create(context_->resolver());
    } catch (...) {
        context_->releaseCurrent();
        throw;
    }
    hasGl_ = device_.has_value();
    if (!hasGl_)
        context_->releaseCurrent();
    return hasGl_;
}

GlDevice* GlWorker::Loop::device()
{
    return hasGl_ ? &*device_ : nullptr;
}

void GlWorker::Loop::run()
{
    Lock lock(mutex_);
    for (;;) {
        if (isExiting_)
            changed_.wait(lock, [] { return false; });
        if (isDisplayClosing_ && hasGl_)
            letGoOfDisplay(lock);
        if (!tasks_.empty()) {
            runTask(lock);
        } else if (isStopping_ && !isExiting_) {
            break;
        } else if (!watched_.empty()) {
            lookAtWatched(lock);
        } else {
            changed_.wait(lock);
        }
    }
    isEnding_ = true;
    isBusy_ = true;
    lock.unlock();
    if (hasGl_.exchange(false)) {
        device_->destroy();
        context_->releaseCurrent();
    }
    while (!watched_.empty())
        watched_.pop()->run(nullptr);
    context_.reset();
    lock.lock();
    isBusy_ = false;
    changed_.notify_all();
}

// The task is dropped before the lock is taken again: it may be the last owner of its worker.
void GlWorker::Loop::runTask(Lock& lock)
{
    current_ = tasks_.pop();
    isBusy_ = true;
    lock.unlock();
    current_->run(device());
    current_ = nullptr;
    lock.lock();
    isBusy_ = false;
    changed_.notify_all();
}

void GlWorker::Loop::lookAtWatched(Lock& lock)
{
    watched_.swap(unseen_);
    mustLookNow_ = false;
    isBusy_ = true;
    lock.unlock();
    while (!unseen_.empty()) {
        current_ = unseen_.pop();
        if (current_->run(device()))
            current_ = nullptr;
        else
            seen_.push(std::move(current_));
    }
    lock.lock();
    isBusy_ = false;
    changed_.notify_all();
    // Those that came in the meantime stand behind.
    watched_.swap(seen_);
    while (!seen_.empty())
        watched_.push(seen_.pop());
    changed_.wait_for(lock, kWatchInterval, [this] {
        return watched_.empty() || mustLookNow_ || !tasks_.empty() || isStopping_ || isExiting_ ||
               (isDisplayClosing_ && hasGl_);
    });
}

void GlWorker::Loop::letGoOfDisplay(Lock& lock)
{
    lock.unlock();
    device_->destroy();
    context_->releaseCurrent();
    context_->abandon();
    lock.lock();
    hasGl_ = false;
    changed_.notify_all();
}

void GlWorker::Loop::post(GlTaskPtr task) noexcept
{
    {
        const std::scoped_lock lock(mutex_);
        if (!isExiting_) {
            tasks_.push(std::move(task));
            changed_.notify_all();
            return;
        }
    }
    task->run(nullptr);
}

void GlWorker::Loop::watch(GlTaskPtr task) noexcept
{
    const std::scoped_lock lock(mutex_);
    watched_.push(std::move(task));
    mustLookNow_ = true;
    changed_.notify_all();
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
        const std::scoped_lock loopLock(loop->mutex_);
        loop->mustLookNow_ = true;
        loop->changed_.notify_all();
    }
}

void GlWorker::Loop::endCall(bool& hasRun) noexcept
{
    const std::scoped_lock lock(mutex_);
    hasRun = true;
    changed_.notify_all();
}

void GlWorker::Loop::waitForCall(const bool& hasRun)
{
    Lock lock(mutex_);
    changed_.wait(lock, [&hasRun] { return hasRun; });
}

bool GlWorker::Loop::requestStop()
{
    const std::scoped_lock lock(mutex_);
    isStopping_ = true;
    changed_.notify_all();
    return !isExiting_;
}

void GlWorker::Loop::markGone()
{
    const std::scoped_lock lock(mutex_);
    isGone_ = true;
    changed_.notify_all();
}

void GlWorker::Loop::Running::tidy()
{
    std::erase_if(entries, [](Entry& entry) {
        if (entry.orphan == nullptr)
            return entry.loop.expired();
        const std::scoped_lock lock(entry.orphan->mutex_);
        const bool hasRun = entry.orphan->isEnding_ && !entry.orphan->isBusy_;
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
    return hasGl_ && context_->callerHasContext() && device_->callerSharesObjects();
}

void GlWorker::Loop::finishCaller() const
{
    device_->finishCaller();
}

GlDevice::CallerLook GlWorker::Loop::lookFromCaller() const
{
    return GlDevice::CallerLook(*device_);
}

void GlWorker::Loop::leaveDisplay()
{
    Lock lock(mutex_);
    isDisplayClosing_ = true;
    changed_.notify_all();
    changed_.wait(lock, [this] { return (!hasGl_ && !isBusy_) || isExiting_; });
}

// A thread that is ending is waited for until it is gone; any other stays where it is.
void GlWorker::Loop::park(std::thread* orphan)
{
    Lock lock(mutex_);
    isExiting_ = true;
    changed_.notify_all();
    if (orphan != nullptr && isEnding_) {
        lock.unlock();
        orphan->join();
        return;
    }
    changed_.wait_for(lock, kExitPatience, [this] { return !isBusy_ && (!isEnding_ || isGone_); });
}

void GlWorker::Loop::listenForDisplay(const std::shared_ptr<Loop>& loop)
{
    loop->context_->onDisplayClosing([weak = std::weak_ptr<Loop>(loop)] {
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
