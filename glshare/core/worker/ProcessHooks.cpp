// Implements ProcessHooks.h for POSIX systems.
#include "core/worker/ProcessHooks.h"

#include <atomic>
#include <cstdlib>
#include <new>

#include <pthread.h>

namespace glshare {

namespace {
std::atomic<bool> theProcessIsForked{false};
}

void callAtExit(void (*call)())
{
    std::atexit(call);
}

void detectForks()
{
    static const bool isDetected =
        pthread_atfork(nullptr, nullptr, [] { theProcessIsForked = true; }) == 0
            ? true
            : throw std::bad_alloc();
    static_cast<void>(isDetected);
}

bool isForkedChild() noexcept
{
    return theProcessIsForked;
}

} // namespace glshare
