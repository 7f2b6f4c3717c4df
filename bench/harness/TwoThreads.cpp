#include "harness/TwoThreads.h"

TwoThreads::TwoThreads() : fOther([this] { serve(); }) {}

TwoThreads::~TwoThreads()
{
    fWork = nullptr;
    fStart.arrive_and_wait();
    fOther.join();
}

Nanoseconds TwoThreads::timedTogether(const std::function<void(std::size_t)>& work)
{
    fWork = &work;
    return timed([&] {
        fStart.arrive_and_wait();
        work(0);
        fEnd.arrive_and_wait();
    });
}

void TwoThreads::serve()
{
    for (;;) {
        fStart.arrive_and_wait();
        if (!fWork)
            return;
        (*fWork)(1);
        fEnd.arrive_and_wait();
    }
}
