#include "core/worker/GlWorker.h"

#include "core/worker/Fork.h"
#include "core/worker/GlWorkerLoop.h"

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
    worker->fThread = std::thread([loop = std::move(loop), promise = std::move(started)]() mutable {
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
    Loop::listenForDisplay(worker->fLoop);
    Loop::listenForExit(worker->fLoop);
    return worker;
}

GlWorker::GlWorker(std::shared_ptr<Loop> loop) : fLoop(std::move(loop)) {}

GlWorker::~GlWorker()
{
    stop();
}

void GlWorker::stop()
{
    if (!fThread.joinable())
        return;
    if (!fLoop->requestStop()) {
        fThread.detach();
    } else if (fThread.get_id() == std::this_thread::get_id()) {
        Loop::adopt(fLoop, std::move(fThread));
    } else {
        fThread.join();
        fLoop->markGone();
    }
}

void GlWorker::post(GlTaskPtr task) noexcept
{
    fLoop->post(std::move(task));
}

void GlWorker::watch(GlTaskPtr task) noexcept
{
    fLoop->watch(std::move(task));
}

void GlWorker::lookNow() noexcept
{
    Loop::lookNow();
}

bool GlWorker::Call::run(GlDevice* device) noexcept
{
    try {
        work(device);
    } catch (...) {
        thrown = std::current_exception();
    }
    return true;
}

void GlWorker::Call::drop() noexcept
{
    loop->endCall(hasRun);
}

void GlWorker::run(Call& call)
{
    call.loop = fLoop.get();
    fLoop->post(GlTaskPtr(&call));
    fLoop->waitForCall(call.hasRun);
    if (call.thrown)
        std::rethrow_exception(call.thrown);
}

bool GlWorker::callerSharesObjects() const
{
    return fLoop->callerSharesObjects();
}

void GlWorker::finishCaller() const
{
    fLoop->finishCaller();
}

GlDevice::CallerLook GlWorker::lookFromCaller() const
{
    return fLoop->lookFromCaller();
}

} // namespace glshare
