// A second thread that stands by, so that starting it is not measured.
#pragma once

#include "harness/Timing.h"

#include <barrier>
#include <functional>
#include <thread>

class TwoThreads {
public:
    TwoThreads();
    ~TwoThreads();
    TwoThreads(const TwoThreads&) = delete;
    TwoThreads& operator=(const TwoThreads&) = delete;

    // Runs `work(0)` on the calling thread and `work(1)` on the other; the time until both are
    // done.
    Nanoseconds timedTogether(const std::function<void(std::size_t thread)>& work);

private:
    void serve();

    std::barrier<> fStart{2};
    std::barrier<> fEnd{2};
    const std::function<void(std::size_t)>* fWork = nullptr; // null ends the thread
    std::thread fOther;
};
