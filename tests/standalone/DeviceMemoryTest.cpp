#include "standalone/DeviceMemory.h"

#include "host/Application.h"
#include "host/MemoryMonitor.h"

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <thread>

namespace {

Zyl::Objects::AMemoryMonitor& monitor()
{
    return Zyl::Objects::ObjModel::MemoryMonitor(0);
}

TEST(DeviceMemory, ReducingKeepsPeak)
{
    monitor().AddToDeviceMemory(100);
    TresourceGuard::initializeOffset();
    monitor().AddToDeviceMemory(50);
    monitor().ReduceFromDeviceMemory(120);
    monitor().AddToDeviceMemory(10);

    EXPECT_EQ(deviceMemoryUse().currentBytes, 40u);
    EXPECT_EQ(deviceMemoryUse().peakBytes, 150u);
    EXPECT_EQ(deviceMemoryUse().offsetBytes, 100u);
}

TEST(DeviceMemory, ConcurrentUseLosesNeitherBytesNorPeak)
{
    using Clock = std::chrono::steady_clock;
    const auto latest = Clock::now() + std::chrono::seconds(2); // for a busy machine
    const std::size_t peakBefore = deviceMemoryUse().peakBytes;
    monitor().AddToDeviceMemory(peakBefore - deviceMemoryUse().currentBytes);

    // The threads meet repeatedly. They spin, because a peak is lost only if both add within
    // nanoseconds.
    std::atomic<unsigned int> arrived = 0;
    const auto meet = [&] {
        const unsigned int everybody = (arrived.fetch_add(1) / 2 + 1) * 2;
        while (arrived.load() < everybody)
            std::this_thread::yield();
    };
    std::size_t added = 0;
    unsigned int lostPeaks = 0;
    std::atomic<bool> hasEnded = false;
    const auto addTogether = [&](bool checks) {
        while (!hasEnded) {
            meet();
            monitor().AddToDeviceMemory(3);
            meet();
            if (checks) {
                // Both have added, so what is in use now is the peak.
                added += 6;
                lostPeaks += deviceMemoryUse().peakBytes != deviceMemoryUse().currentBytes ? 1 : 0;
                hasEnded = added == 600'000 || Clock::now() > latest;
            }
            meet();
        }
    };
    std::jthread other(addTogether, false);
    addTogether(true);
    other.join();
    EXPECT_EQ(lostPeaks, 0u);
    EXPECT_EQ(deviceMemoryUse().currentBytes, peakBefore + added);
}

} // namespace
