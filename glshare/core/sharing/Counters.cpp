#include "core/sharing/Counters.h"

namespace glshare {

Counters& counters() noexcept
{
    static Counters theCounters;
    return theCounters;
}

void getCounters(glshare_counters* result) noexcept
{
    const Counters& from = counters();
    result->acquired_in_place = from.acquiredInPlace;
    result->acquired_by_copy = from.acquiredByCopy;
    result->released_by_copy = from.releasedByCopy;
    result->bytes_copied = from.bytesCopied;
    result->failed_copies = from.failedCopies;
}

} // namespace glshare
