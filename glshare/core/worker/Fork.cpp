#include "core/worker/Fork.h"

#include "core/gl/LibraryFunctions.h"

#include <atomic>
#include <new>

namespace glshare {

namespace {
std::atomic<bool> theProcessIsForked{false};
}

void detectForks()
{
    static const bool isDetected =
        callInForkedChild([] { theProcessIsForked = true; }) ? true : throw std::bad_alloc();
    static_cast<void>(isDetected);
}

bool isForkedChild()
{
    return theProcessIsForked;
}

} // namespace glshare
