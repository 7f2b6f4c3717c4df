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
constexpr bool kReservesAddresses = true; // far more than the machine's memory
#else
constexpr bool kReservesAddresses = false;
#endif

// Bytes. When that little cannot be had, a crash is put down to the lack of memory.
constexpr std::size_t kLittleMemory = std::size_t{64} << 20;

const char* crashText = nullptr;
int crashExitCode = 0;

// Calls only what is safe in a signal handler.
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

void lower(int resource, rlim_t limit)
{
    rlimit limits{};
    if (getrlimit(resource, &limits) != 0)
        return;
    limits.rlim_cur = std::min(limits.rlim_cur, limit);
    setrlimit(resource, &limits);
}

} // namespace

std::FILE* takeStandardOutput()
{
    const int output = dup(STDOUT_FILENO);
    if (output < 0 || dup2(STDERR_FILENO, STDOUT_FILENO) < 0)
        return nullptr;
    return fdopen(output, "wb");
}

bool memoryIsShort()
{
    void* memory =
        mmap(nullptr, kLittleMemory, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    if (memory == MAP_FAILED)
        return true;
    munmap(memory, kLittleMemory);
    return false;
}

void reportCrashWithoutMemory(const char* text, int exitCode)
{
    if (kReservesAddresses) // and has handlers of its own
        return;
    crashText = text;
    crashExitCode = exitCode;
    for (const int signal : {SIGSEGV, SIGBUS, SIGABRT})
        std::signal(signal, endIfMemoryRanOut);
}

void limitResources()
{
    lower(RLIMIT_CORE, 0);
    const long pages = sysconf(_SC_PHYS_PAGES);
    const long pageSize = sysconf(_SC_PAGESIZE);
    if (!kReservesAddresses && pages > 0 && pageSize > 0)
        lower(RLIMIT_AS, static_cast<rlim_t>(pages) / 2 * static_cast<rlim_t>(pageSize));
}

} // namespace viewer
