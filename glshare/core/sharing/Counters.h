// The totals behind glshareGetCounters.
#pragma once

#include "glshare.h"

#include <atomic>
#include <cstdint>

namespace glshare {

// Safe from any thread; the fields are independent of each other.
struct Counters {
    std::atomic<std::uint64_t> acquiredInPlace{0};
    std::atomic<std::uint64_t> acquiredByCopy{0};
    std::atomic<std::uint64_t> releasedByCopy{0};
    std::atomic<std::uint64_t> bytesCopied{0};
    std::atomic<std::uint64_t> failedCopies{0};
};

Counters& counters();

void getCounters(glshare_counters* result);

} // namespace glshare
