#include "standalone/DeviceMemory.h"

#include "host/Application.h"
#include "host/MemoryMonitor.h"

#include <atomic>

namespace {

class DeviceMemoryMonitor final : public Zyl::Objects::AMemoryMonitor {
public:
    void AddToDeviceMemory(std::size_t size) override
    {
        const std::size_t current = fCurrent.fetch_add(size) + size;
        std::size_t peak = fPeak.load();
        while (peak < current && !fPeak.compare_exchange_weak(peak, current)) {
        }
    }

    void ReduceFromDeviceMemory(std::size_t size) override { fCurrent.fetch_sub(size); }

    void noteOffset() { fOffset = fCurrent.load(); }

    DeviceMemoryUse use() const { return {fCurrent.load(), fPeak.load(), fOffset.load()}; }

private:
    std::atomic<std::size_t> fCurrent = 0;
    std::atomic<std::size_t> fPeak = 0;
    std::atomic<std::size_t> fOffset = 0;
};

// Never destroyed: static objects of other modules may release buffers late.
DeviceMemoryMonitor& monitor()
{
    static auto* const theOne = new DeviceMemoryMonitor;
    return *theOne;
}

} // namespace

// This host has one adapter: every index selects it.
Zyl::Objects::AMemoryMonitor& Zyl::Objects::ObjModel::MemoryMonitor(unsigned int /*adapter*/)
{
    return monitor();
}

void TresourceGuard::initializeOffset()
{
    monitor().noteOffset();
}

DeviceMemoryUse deviceMemoryUse()
{
    return monitor().use();
}
