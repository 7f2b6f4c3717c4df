// Measurements on two threads.
#pragma once

#include "harness/Timing.h"

#include <barrier>
#include <functional>
#include <thread>

// Owns a second thread, which waits for work: its start is not measured.
class TwoThreads {
public:
    TwoThreads();
    ~TwoThreads();
    TwoThreads(const TwoThreads&) = delete;
    TwoThreads& operator=(const TwoThreads&) = delete;

    // Runs `work(0)` on the calling thread and `work(1)` on the other. Returns the time until both
    // have finished.
    Nanoseconds timedTogether(const std::function<void(std::size_t thread)>& work);

private:
    void serve();

    std::barrier<> fStart{2};
    std::barrier<> fEnd{2};
    const std::function<void(std::size_t)>* fWork = nullptr; // null ends the thread
    std::thread fOther;
};
