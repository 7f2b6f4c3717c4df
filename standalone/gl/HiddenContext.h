// A context of the renderer's share group for threads without one.
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

// A context on a thread of its own, which runs the calls of other threads. Qt makes a context
// current only on the thread that owns it; native contexts that each caller's thread makes current
// in turn would not work on every window system.
class HiddenContext {
public:
    // Called on the GUI thread. `shared` is the renderer's context, which may be current.
    explicit HiddenContext(QOpenGLContext& shared);
    // Runs the pending calls, then ends the thread and its context.
    ~HiddenContext();
    HiddenContext(const HiddenContext&) = delete;
    HiddenContext& operator=(const HiddenContext&) = delete;

    // Returns whether the context was created and is current on its thread.
    bool valid() const noexcept { return fValid; }

    // Runs `function` with the context current, and returns after it has ended. Calls are run one
    // at a time. Safe from any thread. Requires valid().
    void run(std::function<void()> function);
    // As run, and returns the function's result.
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
