#include "viewer/system/Interrupt.h"

#include <csignal>

namespace viewer {
namespace {

volatile std::sig_atomic_t interruptCount = 0;

void noteInterrupt(int)
{
    interruptCount = 1;
    std::signal(SIGINT, SIG_DFL);
}

} // namespace

void catchInterrupt()
{
    std::signal(SIGINT, noteInterrupt);
}

bool interrupted()
{
    return interruptCount != 0;
}

} // namespace viewer
