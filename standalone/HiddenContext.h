// A context of the renderer's share group, kept for threads that have none of their own.
#pragma once

#include <condition_variable>
#include <deque>
#include <functional>
#include <memory>
#include <mutex>
#include <utility>

class QOffscreenSurface;
class QOpenGLContext;
class QThread;

namespace vyra::host {

// Qt lets a context be current only on the thread that owns it, so the hidden context lives on a
// thread of its own and callers hand it their calls. That works alike on every window system, which
// native contexts, made current on each caller's thread in turn, would not.
class HiddenContext {
public:
    // On the GUI thread. `shared` is the renderer's context; it may be current.
    explicit HiddenContext(QOpenGLContext& shared);
    // Carries out what was handed over, then ends the thread and its context.
    ~HiddenContext();
    HiddenContext(const HiddenContext&) = delete;
    HiddenContext& operator=(const HiddenContext&) = delete;

    // The context could be made and is current on its thread.
    bool valid() const { return fValid; }

    // Runs `function` with the context current, one call at a time; returns when it has ended. From
    // any thread, while valid().
    void run(std::function<void()> function);
    // The same, and returns the function's result.
    template <class Function>
    auto call(Function function) -> decltype(function())
    {
        decltype(function()) result{};
        run([&result, &function] { result = function(); });
        return result;
    }

private:
    struct Task {
        std::function<void()> function;
        bool done = false;
    };

    void serve();

    std::unique_ptr<QOffscreenSurface> fSurface;
    std::unique_ptr<QOpenGLContext> fContext; // of fThread, once that is started
    std::unique_ptr<QThread> fThread;
    bool fValid = false;

    std::mutex fMutex; // guards what follows
    std::condition_variable fChanged;
    std::deque<Task*> fTasks;
    bool fClosing = false;
};

} // namespace vyra::host
