// Operations on several threads at once. ThreadSanitizer reports a missing lock of the library as a
// race, because the runtime's own lock is hidden from it (see QuietLock); elsewhere the counts
// differ.
#include "ManagerTest.h"
#include "PrivateMember.h"
#include "buffers/TopenCLData.h"
#include "buffers/TopenCLDataBufferPool.h"
#include "interop/ConcurrentEventList.h"
#include "kernels/TopenCLKernelStore.h"

#include <algorithm>
#include <atomic>
#include <chrono>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <thread>
#include <utility>

using namespace scripted;

struct Size : PrivateMember<std::atomic<std::size_t> ConcurrentEventList::*> {
    friend Type memberOf(Size);
};
template struct Reveal<Size, &ConcurrentEventList::fSize>;

namespace {

constexpr int kThreads = 4;
constexpr int kRounds = 200;

using ThreadTest = ManagerTest;

TEST_F(ThreadTest, ConcurrentKernelRequestsAreSerialised)
{
    startInModes(1, 1);
    TopenCLKernelStore& store = info().kernelStore();
    const std::string file = testing::TempDir() + "vyra-threads.cl";
    std::ofstream(file) << "skin";
    onThreads(kThreads, [&](int thread) {
        for (int round = 0; round < kRounds; ++round) {
            const int choice = (thread + round) % 3;
            const char* name = choice == 0 ? "a" : "b";
            const auto kernel = choice == 2
                                    ? store.getKernel(file.c_str(), "", "skin", nullptr)
                                    : store.getKernelFromString("skin", name, "", "skin", nullptr);
            EXPECT_NE(kernel.get(), nullptr);
            EXPECT_TRUE(store.freeKernel(kernel));
        }
    });
    std::filesystem::remove(file);
}

TEST_F(ThreadTest, ConcurrentPoolRequestsNeverShareBuffer)
{
    startInModes(1, 1);
    TopenCLDataBufferPool pool;
    const TopenCLDataBufferDescriptor descriptor(Tplug(1, 2), TuniqueString("positions"),
                                                 TopenCLDataBufferDescriptor::kReadWrite, 4, 16, 0);
    for (const bool takeBack : {false, true}) {
        onThreads(kThreads, [&](int) {
            for (int round = 0; round < kRounds; ++round) {
                EXPECT_NE(pool.createBuffer(descriptor).buffer().get(), nullptr);
                if (takeBack)
                    pool.releaseBuffers();
            }
        });
        EXPECT_EQ(runtime().created(Kind::kMem), unsigned{kThreads * kRounds});
        pool.releaseBuffers();
    }
}

TEST_F(ThreadTest, ConcurrentDataMapUseKeepsAllEntries)
{
    startInModes(1, 1);
    TopenCLData data;
    onThreads(kThreads, [&data](int thread) {
        const TuniqueString name("positions");
        for (unsigned round = 0; round < kRounds; ++round) {
            const Tplug own(static_cast<unsigned>(thread), round);
            data.setData(name, own, TopenCLDataBuffer(own, name, {}, 4, 1, 4));
            EXPECT_EQ(data.getData(name, own).descriptor().capacityInBytes(), 4U);
            data.getData(name, Tplug(kThreads, 0));
            data.getSinglePlug();
        }
    });
    EXPECT_EQ(std::distance(data.begin(), data.end()), kThreads * kRounds);
}

TEST_F(ThreadTest, ConcurrentlyReportedEventsAreAwaitedOnce)
{
    const auto* batched = startWithBuffer(1, 3);
    manager().PreEvaluate(kId);
    const TopenCLSharedBuffer* unbatched[kThreads];
    for (auto& buffer : unbatched)
        buffer = create();
    AutoCLObject<cl_event> released[kThreads][kRounds];
    onThreads(kThreads, [&](int thread) {
        for (AutoCLObject<cl_event>& event : released[thread]) {
            AutoCLObject<cl_event> acquired;
            acquire(batched, acquired.receive());
            const cl_event reported = acquired.get();
            manager().EnqueueReleaseBatchedSharedCLBuffer(1, &reported);
            acquire(unbatched[thread]);
            release(unbatched[thread], event.receive());
        }
    });
    calls();
    manager().PostEvaluate(kId);
    const Lines lines = calls();
    // Plus one: the batch's own acquire, and the batch's release.
    EXPECT_EQ(countOf(lines, "clReleaseEvent(event#1)"), std::size_t{kThreads * kRounds + 1});
    EXPECT_EQ(countOf(lines, "glWaitSync"), std::size_t{kThreads * kRounds + 1});
}

TEST_F(ThreadTest, ConcurrentCreateAndDestroyKeepBatchConsistent)
{
    startIn(1, 1);
    onThreads(kThreads, [this](int thread) {
        for (int round = 0; round < kRounds; ++round) {
            const auto* buffer = create();
            ASSERT_NE(buffer, nullptr);
            if ((thread + round) % 2)
                EXPECT_EQ(manager().DestroySharedCLBuffer(buffer), 0);
            else
                EXPECT_EQ(manager().DestroyBatchedSharedCLBuffer(buffer), 0);
        }
    });
}

TEST_F(ThreadTest, OneThreadWaitsForFenceAndOthersFollow)
{
    startIn(2, 1);
    const TopenCLSharedBuffer* buffers[kThreads];
    for (auto& buffer : buffers)
        buffer = create();
    for (int round = 0; round < kRounds; ++round) {
        manager().RenderingComplete();
        runtime().scriptClientWaits(std::deque<unsigned>(20, 0x911B)); // a long wait
        calls();
        onThreads(kThreads, [&](int thread) { acquire(buffers[thread]); });
        Lines lines = calls();
        std::erase(lines, "resourceWindow()");
        // 21 waits, one deletion, and only then the acquires.
        ASSERT_EQ(lines.size(), std::size_t{22 + kThreads});
        EXPECT_THAT(lines[20], ::testing::StartsWith("glClientWaitSync"));
        EXPECT_THAT(lines[21], ::testing::StartsWith("glDeleteSync"));
        for (const auto* buffer : buffers)
            release(buffer);
    }
}

// The list to which several threads report events while another one reads it.
constexpr std::uintptr_t kEventsEach = 300; // more than the initial capacity

// Never dereferenced.
cl_event fakeEvent(std::uintptr_t thread, std::uintptr_t number)
{
    // NOLINTNEXTLINE(performance-no-int-to-ptr): it is never dereferenced.
    return reinterpret_cast<cl_event>(thread * kEventsEach + number + 1);
}

std::uintptr_t threadOf(cl_event event)
{
    return (reinterpret_cast<std::uintptr_t>(event) - 1) / kEventsEach;
}

std::vector<cl_event> contentsOf(const ConcurrentEventList& list)
{
    std::vector<cl_event> events;
    list.copyTo(events);
    return events;
}

bool beginsWith(const std::vector<cl_event>& whole, const std::vector<cl_event>& beginning)
{
    return std::ranges::mismatch(beginning, whole).in1 == beginning.end();
}

TEST(ConcurrentEventList, CopiesDuringAppendsGrowToAllEvents)
{
    for (int evaluation = 0; evaluation < 100; ++evaluation) {
        ConcurrentEventList list;
        for (int round = 0; round < 2; ++round) {
            std::atomic<bool> done = false;
            std::vector<cl_event> copy;
            bool grows = true;
            std::thread reader([&] {
                while (!done) {
                    const std::vector<cl_event> former = std::exchange(copy, contentsOf(list));
                    grows = grows && beginsWith(copy, former);
                }
            });
            onThreads(kThreads, [&list](int thread) {
                for (std::uintptr_t number = 0; number < kEventsEach; ++number)
                    list.append(fakeEvent(static_cast<std::uintptr_t>(thread), number));
            });
            done = true;
            reader.join();
            std::vector<cl_event> events = contentsOf(list);
            ASSERT_TRUE(grows && beginsWith(events, copy));
            ASSERT_EQ(events.size(), kThreads * kEventsEach);
            // All events of each thread are present, in the order in which it appended them.
            std::ranges::stable_sort(events, {}, threadOf);
            for (std::uintptr_t i = 0; i < events.size(); ++i)
                ASSERT_EQ(events[i], fakeEvent(i / kEventsEach, i % kEventsEach));
            list.clear();
            EXPECT_TRUE(contentsOf(list).empty());
        }
    }
}

TEST(ConcurrentEventList, CopyWaitsForTakenSlotWrittenBeforeClear)
{
    ConcurrentEventList list;
    list.append(fakeEvent(0, 0));
    list.append(fakeEvent(0, 1));
    list.clear();
    list.append(fakeEvent(1, 0));
    std::atomic<std::size_t>& size = list.*memberOf(Size());
    size = 2; // another append has taken a slot but not written it
    std::vector<cl_event> seen;
    std::atomic<bool> reading = false;
    std::thread reader([&] {
        list.forEach([&](cl_event event) {
            seen.push_back(event);
            reading = true;
        });
    });
    while (!reading)
        std::this_thread::yield();
    std::this_thread::sleep_for(
        std::chrono::milliseconds(50)); // so that it reads the unwritten slot
    size = 1;
    list.append(fakeEvent(1, 1));
    reader.join();
    EXPECT_EQ(seen, (std::vector{fakeEvent(1, 0), fakeEvent(1, 1)}));
}

} // namespace
