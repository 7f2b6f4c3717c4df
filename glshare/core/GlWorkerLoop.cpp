#include "core/GlWorkerLoop.h"

#include "core/LibraryFunctions.h"

#include <algorithm>
#include <chrono>
#include <iterator>
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
    struct Orphan {
        std::shared_ptr<Loop> loop;
        std::thread thread;
    };

    std::mutex mutex; // guards the rest
    std::vector<std::weak_ptr<Loop>> loops;
    std::vector<Orphan> orphans; // threads that nobody has joined
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
    if (context_->makeCurrent()) {
        device_ = GlDevice::create(context_->resolver());
        hasGl_ = device_.has_value();
        if (hasGl_)
            return true;
        context_->releaseCurrent();
    }
    context_.reset();
    return false;
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
        if (!jobs_.empty()) {
            runJob(lock);
        } else if (isStopping_ && !isExiting_) {
            break;
        } else if (!watches_.empty()) {
            lookAtWatches(lock);
        } else {
            changed_.wait(lock);
        }
    }
    isEnding_ = true;
    isBusy_ = true;
    lock.unlock();
    if (hasGl_.exchange(false))
        context_->releaseCurrent();
    for (const Watch& watch : watches_)
        watch(nullptr);
    context_.reset();
    lock.lock();
    isBusy_ = false;
    changed_.notify_all();
}

// The job is destroyed before the lock is taken again: it may be the last owner of its worker.
void GlWorker::Loop::runJob(Lock& lock)
{
    Job job = std::move(jobs_.front());
    jobs_.pop_front();
    isBusy_ = true;
    lock.unlock();
    job(device());
    job = nullptr;
    lock.lock();
    isBusy_ = false;
    changed_.notify_all();
}

void GlWorker::Loop::lookAtWatches(Lock& lock)
{
    std::vector<Watch> watches = std::exchange(watches_, {});
    isBusy_ = true;
    lock.unlock();
    std::erase_if(watches, [this](const Watch& watch) { return watch(device()); });
    lock.lock();
    isBusy_ = false;
    changed_.notify_all();
    watches_.insert(watches_.end(), std::make_move_iterator(watches.begin()),
                    std::make_move_iterator(watches.end()));
    if (!watches_.empty() && jobs_.empty() && !isStopping_ && !isExiting_)
        changed_.wait_for(lock, kWatchInterval);
}

void GlWorker::Loop::letGoOfDisplay(Lock& lock)
{
    lock.unlock();
    context_->releaseCurrent();
    context_->abandon();
    lock.lock();
    hasGl_ = false;
    changed_.notify_all();
}

void GlWorker::Loop::post(Job job)
{
    {
        const std::scoped_lock lock(mutex_);
        if (!isExiting_) {
            jobs_.push_back(std::move(job));
            changed_.notify_all();
            return;
        }
    }
    job(nullptr);
}

void GlWorker::Loop::watch(Watch watch)
{
    const std::scoped_lock lock(mutex_);
    watches_.push_back(std::move(watch));
    changed_.notify_all();
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

// Those adopted before have ended long since.
void GlWorker::Loop::adopt(std::shared_ptr<Loop> loop, std::thread thread)
{
    Running& running = Running::get();
    const std::scoped_lock lock(running.mutex);
    std::erase_if(running.orphans, [](Running::Orphan& orphan) {
        const std::scoped_lock loopLock(orphan.loop->mutex_);
        const bool hasRun = orphan.loop->isEnding_ && !orphan.loop->isBusy_;
        if (hasRun)
            orphan.thread.join();
        return hasRun;
    });
    running.orphans.push_back({std::move(loop), std::move(thread)});
}

bool GlWorker::Loop::callerSharesObjects() const
{
    return hasGl_ && context_->callerHasContext() && device_->callerSharesObjects();
}

void GlWorker::Loop::finishCaller() const
{
    device_->finishCaller();
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
    std::erase_if(running.loops, [](const std::weak_ptr<Loop>& other) { return other.expired(); });
    running.loops.push_back(loop);
    if (!std::exchange(running.isRegistered, true))
        callAtExit(parkAll);
}

void GlWorker::Loop::parkAll()
{
    Running& running = Running::get();
    const std::scoped_lock lock(running.mutex);
    for (Running::Orphan& orphan : running.orphans)
        orphan.loop->park(&orphan.thread);
    for (const std::weak_ptr<Loop>& weak : running.loops) {
        const std::shared_ptr<Loop> loop = weak.lock();
        const auto isLoop = [&loop](const Running::Orphan& orphan) { return orphan.loop == loop; };
        if (loop && std::ranges::none_of(running.orphans, isLoop))
            loop->park(nullptr);
    }
}

} // namespace glshare
