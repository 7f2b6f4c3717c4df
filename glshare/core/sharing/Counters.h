// The totals that glshareGetCounters returns.
#pragma once

#include "glshare.h"

#include <atomic>
#include <cstdint>

namespace glshare {

// Any thread. The fields are not synchronised with each other.
struct Counters {
    std::atomic<std::uint64_t> acquiredInPlace{0};
    std::atomic<std::uint64_t> acquiredByCopy{0};
    std::atomic<std::uint64_t> releasedByCopy{0};
    std::atomic<std::uint64_t> bytesCopied{0};
    std::atomic<std::uint64_t> failedCopies{0};
};

[[nodiscard]] Counters& counters() noexcept;

// Implements glshareGetCounters.
void getCounters(glshare_counters* result) noexcept;

} // namespace glshare
