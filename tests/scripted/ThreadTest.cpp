// What several threads may do at once. ThreadSanitizer sees the library, not the runtime below it
// (see QuietLock), so a lock that is missing shows as a race here; the counts show it elsewhere.
#include "ManagerTest.h"
#include "buffers/TopenCLData.h"
#include "buffers/TopenCLDataBufferPool.h"
#include "kernels/TopenCLKernelStore.h"

#include <algorithm>
#include <atomic>
#include <filesystem>
#include <fstream>
#include <functional>
#include <set>
#include <thread>

using namespace scripted;

namespace {

constexpr int kThreads = 4;
constexpr int kRounds = 200;

// Runs `body` on all threads, which begin together; the argument is the thread's number.
void onThreads(const std::function<void(int)>& body)
{
    std::atomic<int> arrived = 0;
    std::vector<std::jthread> threads;
    threads.reserve(kThreads);
    for (int thread = 0; thread < kThreads; ++thread) {
        threads.emplace_back([&, thread] {
            ++arrived;
            while (arrived < kThreads)
                std::this_thread::yield();
            body(thread);
        });
    }
}

using ThreadTest = ManagerTest;

TEST_F(ThreadTest, KernelRequestsTakeTurns)
{
    startInModes(1, 1);
    TopenCLKernelStore& store = TopenCLInfo::theOne().kernelStore();
    const std::string file = testing::TempDir() + "vyra-threads.cl";
    std::ofstream(file) << "skin";
    onThreads([&](int thread) {
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

TEST_F(ThreadTest, PoolBuffersAreHandedOutOnceAndTakenBackByAnyone)
{
    startInModes(1, 1);
    TopenCLDataBufferPool pool;
    const TopenCLDataBufferDescriptor descriptor(Tplug(1, 2), TuniqueString("positions"),
                                                 TopenCLDataBufferDescriptor::kReadWrite, 4, 16, 0);
    for (const bool takeBack : {false, true}) {
        onThreads([&](int) {
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

TEST_F(ThreadTest, TheDataMapIsFilledAndReadAtOnce)
{
    startInModes(1, 1);
    TopenCLData data;
    onThreads([&data](int thread) {
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

TEST_F(ThreadTest, EveryReportedEventIsWaitedForOnce)
{
    const auto* batched = startWithBuffer(1, 3);
    manager().PreEvaluate(kId);
    const TopenCLSharedBuffer* alone[kThreads];
    for (auto& buffer : alone)
        buffer = create();
    AutoCLObject<cl_event> released[kThreads][kRounds];
    onThreads([&](int thread) {
        for (AutoCLObject<cl_event>& event : released[thread]) {
            AutoCLObject<cl_event> acquired;
            acquire(batched, acquired.receive());
            const cl_event reported = acquired.get();
            manager().EnqueueReleaseBatchedSharedCLBuffer(1, &reported);
            acquire(alone[thread]);
            release(alone[thread], event.receive());
        }
    });
    calls();
    manager().PostEvaluate(kId);
    const Lines lines = calls();
    // The batch's own acquire is waited for, too, and the renderer waits for the batch's release.
    EXPECT_EQ(std::ranges::count(lines, "clReleaseEvent(event#1)"), kThreads * kRounds + 1);
    const auto isWait = [](const std::string& line) { return line.starts_with("glWaitSync"); };
    EXPECT_EQ(std::ranges::count_if(lines, isWait), kThreads * kRounds + 1);
}

TEST_F(ThreadTest, SharedBuffersComeAndGoAtOnce)
{
    startIn(1, 1);
    onThreads([this](int thread) {
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

TEST_F(ThreadTest, OneThreadWaitsForTheFenceAndNobodyOvertakesIt)
{
    startIn(2, 1);
    const TopenCLSharedBuffer* buffers[kThreads];
    for (auto& buffer : buffers)
        buffer = create();
    for (int round = 0; round < kRounds; ++round) {
        manager().RenderingComplete();
        runtime().scriptClientWaits(std::deque<unsigned>(20, 0x911B)); // a long wait
        calls();
        onThreads([&](int thread) { acquire(buffers[thread]); });
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

} // namespace
