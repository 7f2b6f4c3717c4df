#include "standalone/gl/HiddenContext.h"

#include <QOffscreenSurface>
#include <QOpenGLContext>
#include <QThread>

namespace vyra::host {

HiddenContext::HiddenContext(QOpenGLContext& shared)
    : fSurface(std::make_unique<QOffscreenSurface>()), fContext(std::make_unique<QOpenGLContext>())
{
    fSurface->setFormat(shared.format());
    fSurface->create();
    fContext->setFormat(shared.format());
    fContext->setShareContext(&shared);
    if (!fSurface->isValid() || !fContext->create() ||
        !QOpenGLContext::areSharing(fContext.get(), &shared)) {
        return;
    }
    fThread.reset(QThread::create([this] { serve(); }));
    fContext->moveToThread(fThread.get());
    fThread->start();
    // Returns after the thread has tried to make its context current.
    run([this] { fValid = QOpenGLContext::currentContext() == fContext.get(); });
}

HiddenContext::~HiddenContext()
{
    if (fThread == nullptr) {
        return;
    }
    {
        const std::scoped_lock lock(fMutex);
        fClosing = true;
    }
    fChanged.notify_all();
    fThread->wait();
}

void HiddenContext::run(std::function<void()> function)
{
    Task task{std::move(function)};
    std::unique_lock lock(fMutex);
    fTasks.push_back(&task);
    fChanged.notify_all();
    fChanged.wait(lock, [&task] { return task.done; });
}

void HiddenContext::serve()
{
    fContext->makeCurrent(fSurface.get());
    std::unique_lock lock(fMutex);
    while (true) {
        fChanged.wait(lock, [this] { return fClosing || !fTasks.empty(); });
        if (fTasks.empty()) {
            break;
        }
        Task* const task = fTasks.front();
        fTasks.pop_front();
        lock.unlock();
        task->function();
        lock.lock();
        task->done = true;
        fChanged.notify_all();
    }
    // A context that is not current can be destroyed on any thread.
    fContext->doneCurrent();
}

} // namespace vyra::host
