#include "core/worker/GlWorker.h"

#include "core/worker/GlWorkerLoop.h"
#include "core/worker/ProcessHooks.h"

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
            isUsable = loop->makeCurrent();
            promise.set_value(isUsable);
        } catch (...) {
            promise.set_exception(std::current_exception());
        }
        if (isUsable)
            loop->run();
    });
    if (!isRunning.get())
        return nullptr;
    Loop::handleDisplayClosing(worker->fLoop);
    Loop::registerForExit(worker->fLoop);
    return worker;
}

GlWorker::GlWorker(std::shared_ptr<Loop> loop) noexcept : fLoop(std::move(loop)) {}

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
        Loop::joinLater(fLoop, std::move(fThread));
    } else {
        fThread.join();
        fLoop->markJoined();
    }
}

void GlWorker::post(GlTaskPtr task) noexcept
{
    fLoop->post(std::move(task));
}

void GlWorker::poll(GlTaskPtr task) noexcept
{
    fLoop->poll(std::move(task));
}

void GlWorker::pollNow() noexcept
{
    Loop::pollNow();
}

bool GlWorker::Call::run(GlBufferAccess* gl) noexcept
{
    try {
        work(gl);
    } catch (...) {
        thrown = std::current_exception();
    }
    return true;
}

void GlWorker::Call::dispose() noexcept
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

bool GlWorker::isCallerInShareGroup() const
{
    return fLoop->isCallerInShareGroup();
}

void GlWorker::finishCaller() const
{
    fLoop->finishCaller();
}

GlBufferAccess::CallerAccess GlWorker::callerAccess() const
{
    return fLoop->callerAccess();
}

} // namespace glshare
