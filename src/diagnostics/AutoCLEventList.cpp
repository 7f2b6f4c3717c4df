#include "diagnostics/AutoCLEventList.h"

#include "buffers/TopenCLBuffer.h"

#include <algorithm>

namespace {

// Storage grows by one half, which wastes less than doubling.
unsigned int grownCapacity(unsigned int capacity, unsigned int needed)
{
    return std::max(capacity + capacity / 2, needed);
}

} // namespace

AutoCLEventList::AutoCLEventList() = default;
AutoCLEventList::~AutoCLEventList() = default;

AutoCLEventList::AutoCLEventList(const AutoCLEventList& other)
{
    *this = other;
}

AutoCLEventList& AutoCLEventList::operator=(const AutoCLEventList& other)
{
    if (this == &other)
        return *this;
    if (other.fSize > fCapacity) {
        const unsigned int capacity = grownCapacity(fCapacity, other.fSize);
        fEvents = std::make_unique_for_overwrite<cl_event[]>(capacity);
        fCapacity = capacity;
    }
    std::copy_n(other.fEvents.get(), other.fSize, fEvents.get());
    fSize = other.fSize;
    return *this;
}

// Provides capacity for at least one more event.
void AutoCLEventList::grow()
{
    const unsigned int capacity = grownCapacity(fCapacity, fSize + 1);
    auto grown = std::make_unique_for_overwrite<cl_event[]>(capacity);
    std::copy_n(fEvents.get(), fSize, grown.get());
    fEvents = std::move(grown);
    fCapacity = capacity;
}

void AutoCLEventList::add(TopenCLBuffer& buffer)
{
    add(buffer.bufferReadyEvent());
}

const cl_event* AutoCLEventList::array() const
{
    return fSize ? fEvents.get() : nullptr;
}

unsigned int AutoCLEventList::size() const
{
    return fSize;
}
