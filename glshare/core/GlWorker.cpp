#include "core/GlWorker.h"

#include "core/Fork.h"
#include "core/GlWorkerLoop.h"

#include <exception>
#include <future>
#include <utility>

namespace glshare {

std::unique_ptr<GlWorker> GlWorker::start(std::unique_ptr<GlContext> context)
{
    detectForks();
    auto loop = std::make_shared<Loop>(std::move(context));
    std::promise<bool> started;
    std::future<bool> isRunning = started.get_future();
    std::unique_ptr<GlWorker> worker(new GlWorker(loop));
    worker->thread_ = std::thread([loop = std::move(loop), promise = std::move(started)]() mutable {
        bool isUsable = false;
        try {
            isUsable = loop->begin();
            promise.set_value(isUsable);
        } catch (...) {
            promise.set_exception(std::current_exception());
        }
        if (isUsable)
            loop->run();
    });
    if (!isRunning.get())
        return nullptr;
    Loop::listenForDisplay(worker->loop_);
    Loop::listenForExit(worker->loop_);
    return worker;
}

GlWorker::GlWorker(std::shared_ptr<Loop> loop) : loop_(std::move(loop)) {}

GlWorker::~GlWorker()
{
    stop();
}

void GlWorker::stop()
{
    if (!thread_.joinable())
        return;
    if (!loop_->requestStop()) {
        thread_.detach();
    } else if (thread_.get_id() == std::this_thread::get_id()) {
        Loop::adopt(loop_, std::move(thread_));
    } else {
        thread_.join();
        loop_->markGone();
    }
}

void GlWorker::post(Job job)
{
    PreparedJob prepared;
    prepared.push_back(std::move(job));
    loop_->post(std::move(prepared));
}

void GlWorker::post(PreparedJob job) noexcept
{
    loop_->post(std::move(job));
}

void GlWorker::call(const Job& job)
{
    std::promise<void> done;
    post([&](GlDevice* device) {
        try {
            job(device);
            done.set_value();
        } catch (...) {
            done.set_exception(std::current_exception());
        }
    });
    done.get_future().get();
}

void GlWorker::watch(Watch watch)
{
    PreparedWatch prepared;
    prepared.push_back(std::move(watch));
    loop_->watch(std::move(prepared));
}

void GlWorker::watch(PreparedWatch watch) noexcept
{
    loop_->watch(std::move(watch));
}

bool GlWorker::callerSharesObjects() const
{
    return loop_->callerSharesObjects();
}

void GlWorker::finishCaller() const
{
    loop_->finishCaller();
}

} // namespace glshare
