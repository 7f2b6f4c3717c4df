#include "viewer/system/Process.h"

#include <algorithm>
#include <csignal>
#include <cstring>

#include <sys/mman.h>
#include <sys/resource.h>
#include <unistd.h>

namespace viewer {
namespace {

#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
// Sanitizers reserve more addresses than the machine has memory.
constexpr bool kReservesAddresses = true;
#else
constexpr bool kReservesAddresses = false;
#endif

// Bytes. If this allocation fails, a crash counts as caused by lack of memory.
constexpr std::size_t kSmallAllocation = std::size_t{64} << 20;

const char* crashText = nullptr;
int crashExitCode = 0;

// Calls only functions that are safe in a signal handler.
void endIfMemoryRanOut(int signal)
{
    if (memoryIsShort()) {
        [[maybe_unused]] const ssize_t written =
            write(STDERR_FILENO, crashText, std::strlen(crashText));
        _exit(crashExitCode);
    }
    std::signal(signal, SIG_DFL);
    raise(signal);
}

void lowerLimit(int resource, rlim_t limit)
{
    rlimit limits{};
    if (getrlimit(resource, &limits) != 0)
        return;
    limits.rlim_cur = std::min(limits.rlim_cur, limit);
    setrlimit(resource, &limits);
}

} // namespace

std::FILE* takeStandardOutput() noexcept
{
    const int output = dup(STDOUT_FILENO);
    if (output < 0 || dup2(STDERR_FILENO, STDOUT_FILENO) < 0)
        return nullptr;
    return fdopen(output, "wb");
}

bool memoryIsShort() noexcept
{
    void* memory =
        mmap(nullptr, kSmallAllocation, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    if (memory == MAP_FAILED)
        return true;
    munmap(memory, kSmallAllocation);
    return false;
}

void reportCrashWithoutMemory(const char* text, int exitCode) noexcept
{
    if (kReservesAddresses) // sanitizers have handlers of their own
        return;
    crashText = text;
    crashExitCode = exitCode;
    for (const int signal : {SIGSEGV, SIGBUS, SIGABRT})
        std::signal(signal, endIfMemoryRanOut);
}

void limitResources() noexcept
{
    lowerLimit(RLIMIT_CORE, 0);
    const long pages = sysconf(_SC_PHYS_PAGES);
    const long pageSize = sysconf(_SC_PAGESIZE);
    if (!kReservesAddresses && pages > 0 && pageSize > 0)
        lowerLimit(RLIMIT_AS, static_cast<rlim_t>(pages) / 2 * static_cast<rlim_t>(pageSize));
}

} // namespace viewer
