#include "viewer/system/Interrupt.h"

#include <csignal>

namespace viewer {
namespace {

volatile std::sig_atomic_t isInterrupted = 0;

void handleInterrupt(int)
{
    isInterrupted = 1;
    std::signal(SIGINT, SIG_DFL);
}

} // namespace

void catchInterrupt() noexcept
{
    std::signal(SIGINT, handleInterrupt);
}

bool interrupted() noexcept
{
    return isInterrupted != 0;
}

} // namespace viewer
