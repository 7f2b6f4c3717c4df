#include "standalone/DeviceMemory.h"

#include "host/Application.h"
#include "host/MemoryMonitor.h"

#include <gtest/gtest.h>

#include <barrier>
#include <thread>
#include <vector>

namespace {

Zyl::Objects::AMemoryMonitor& monitor()
{
    return Zyl::Objects::ObjModel::MemoryMonitor(0);
}

TEST(DeviceMemory, KeepsThePeakWhenMemoryIsGivenBack)
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

TEST(DeviceMemory, LosesNoByteBetweenThreads)
{
    constexpr unsigned int threadCount = 8;
    constexpr unsigned int buffersPerThread = 20'000;
    std::barrier everybody(threadCount);
    {
        std::vector<std::jthread> threads;
        for (unsigned int i = 0; i < threadCount; ++i) {
            threads.emplace_back([&everybody] {
                for (unsigned int buffer = 0; buffer < buffersPerThread; ++buffer) {
                    monitor().AddToDeviceMemory(3);
                }
                // All of it is in use here, so this is the peak.
                everybody.arrive_and_wait();
                for (unsigned int buffer = 0; buffer < buffersPerThread; ++buffer) {
                    monitor().ReduceFromDeviceMemory(3);
                }
            });
        }
    }
    EXPECT_EQ(deviceMemoryUse().currentBytes, 0u);
    EXPECT_EQ(deviceMemoryUse().peakBytes, std::size_t{3} * threadCount * buffersPerThread);
}

} // namespace
