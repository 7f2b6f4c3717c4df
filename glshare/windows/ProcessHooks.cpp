// Implements ProcessHooks.h for Windows, which ends all threads before exit handlers run and has no
// fork.
#include "core/worker/ProcessHooks.h"

namespace glshare {

void callAtExit(void (* /*call*/)()) {}

void detectForks() {}

bool isForkedChild() noexcept
{
    return false;
}

} // namespace glshare
