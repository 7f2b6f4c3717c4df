#include "diagnostics/AutoCLEventList.h"

#include "buffers/TopenCLBuffer.h"

#include <algorithm>

namespace {

// Storage grows by one half, which wastes less than doubling; standard vectors here double.
std::size_t grownCapacity(const std::vector<cl_event>& events, std::size_t needed)
{
    return std::max(events.capacity() + events.capacity() / 2, needed);
}

} // namespace

AutoCLEventList::AutoCLEventList() = default;
AutoCLEventList::AutoCLEventList(const AutoCLEventList& other) = default;
AutoCLEventList::~AutoCLEventList() = default;

AutoCLEventList& AutoCLEventList::operator=(const AutoCLEventList& other)
{
    if (this == &other)
        return *this;
    if (other.fEvents.size() > fEvents.capacity()) {
        std::vector<cl_event> grown;
        grown.reserve(grownCapacity(fEvents, other.fEvents.size()));
        fEvents.swap(grown);
    }
    fEvents.assign(other.fEvents.begin(), other.fEvents.end());
    return *this;
}

// Makes room for one more event at least.
void AutoCLEventList::grow()
{
    fEvents.reserve(grownCapacity(fEvents, fEvents.size() + 1));
}

void AutoCLEventList::add(TopenCLBuffer& buffer)
{
    add(buffer.bufferReadyEvent());
}

const cl_event* AutoCLEventList::array() const
{
    return fEvents.empty() ? nullptr : fEvents.data();
}

unsigned int AutoCLEventList::size() const
{
    return static_cast<unsigned int>(fEvents.size());
}
