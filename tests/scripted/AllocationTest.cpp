// Running out of memory: what is promised to stay unchanged does, and nothing leaks or stays
// locked.
//
// This file replaces the program's operator new. A test counts the allocations of an operation and
// makes each of them fail in turn; the scripted runtime's own are left out.
#include "FaultBench.h"
#include "diagnostics/AutoCLEventList.h"
#include "diagnostics/CLInternalWarning.h"
#include "interop/ConcurrentEventList.h"

#include <algorithm>
#include <cstdlib>
#include <functional>
#include <iterator>
#include <new>
#include <utility>

namespace {

// Allocations of this thread until one fails; 0: none fails.
thread_local unsigned allocationsLeft = 0;
thread_local unsigned allocations = 0;

bool nextFails()
{
    if (scripted::InsideRuntime::here())
        return false;
    ++allocations;
    return allocationsLeft != 0 && --allocationsLeft == 0;
}

} // namespace

void* operator new(std::size_t size, const std::nothrow_t&) noexcept
{
    return nextFails() ? nullptr : std::malloc(size ? size : 1);
}
void* operator new(std::size_t size)
{
    void* memory = operator new(size, std::nothrow);
    if (!memory)
        throw std::bad_alloc();
    return memory;
}
// A sanitizer's own would not come by.
void* operator new[](std::size_t size, const std::nothrow_t&) noexcept
{
    return operator new(size, std::nothrow);
}
void* operator new[](std::size_t size)
{
    return operator new(size);
}
// Not inlined, or a compiler sees free where it expects the counterpart of new.
[[gnu::noinline]] void operator delete(void* memory) noexcept
{
    std::free(memory);
}
[[gnu::noinline]] void operator delete(void* memory, std::size_t) noexcept
{
    std::free(memory);
}
[[gnu::noinline]] void operator delete[](void* memory) noexcept
{
    std::free(memory);
}
[[gnu::noinline]] void operator delete[](void* memory, std::size_t) noexcept
{
    std::free(memory);
}

#ifndef _WIN32
// What the allocators of TBB's containers call. A program's own goes before TBB's; on Windows that
// is not so, and there the tests of such containers are left out.
namespace tbb::detail::r1 {

void* allocate_memory(std::size_t size)
{
    return operator new(size);
}
void deallocate_memory(void* memory)
{
    operator delete(memory);
}
void* cache_aligned_allocate(std::size_t size)
{
    constexpr std::size_t kLine = 128;
    void* memory =
        nextFails() ? nullptr : std::aligned_alloc(kLine, (size + kLine - 1) / kLine * kLine);
    if (!memory)
        throw std::bad_alloc();
    return memory;
}
void cache_aligned_deallocate(void* memory)
{
    std::free(memory);
}

} // namespace tbb::detail::r1
#endif

namespace scripted {
namespace {

struct Row : Named {
    std::function<void(Bench&)> prepare;
    std::function<int(Bench&)> run;
};

class OutOfMemory : public ScriptedTest, public ::testing::WithParamInterface<Row> {
protected:
    void SetUp() override { ASSERT_TRUE(start()); }

    static unsigned countAllocations()
    {
        Bench bench;
        GetParam().prepare(bench);
        allocations = 0;
        GetParam().run(bench);
        return allocations;
    }
};

// A program that was built stays cached though its kernel could not be listed.
Lines withoutPrograms()
{
    Lines lines = runtime().balance();
    std::erase_if(lines, [](const std::string& line) { return line.starts_with("program"); });
    return lines;
}

TEST_P(OutOfMemory, LosesNothingAndWorksWhenTriedAgain)
{
    const unsigned count = countAllocations();
    ASSERT_GT(count, 0U);
    const Lines before = runtime().balance();
    for (unsigned nth = 1; nth <= count; ++nth) {
        SCOPED_TRACE(nth);
        {
            Bench bench;
            GetParam().prepare(bench);
            const Lines prepared = withoutPrograms();
            allocationsLeft = nth;
            EXPECT_THROW(GetParam().run(bench), std::bad_alloc);
            allocationsLeft = 0;
            EXPECT_EQ(withoutPrograms(), prepared) << "something was taken or lost";
            EXPECT_EQ(GetParam().run(bench), 1) << "tried again";
        }
        EXPECT_EQ(runtime().balance(), before);
    }
}
INSTANTIATE_TEST_SUITE_P(Allocation, OutOfMemory,
                         ::testing::Values(Row{"KernelBuilt", [](Bench& b) { b.makeStore(); },
                                               [](Bench& b) { return b.getKernel(); }},
                                           Row{"PoolCreates", [](Bench& b) { b.makePool(0); },
                                               [](Bench& b) { return b.fromPool(64); }},
                                           Row{"SharedBuffer", [](Bench& b) { b.makeManager(0); },
                                               [](Bench& b) { return b.createShared(); }}),
                         ::testing::PrintToStringParamName());

// Runs `operation` with each of its allocations failing in turn, until none does, and `check` each
// time that it ran out of memory. Returns how often it ran.
template <typename Operation, typename Check>
unsigned untilMemorySuffices(const Operation& operation, const Check& check)
{
    for (unsigned nth = 1;; ++nth) {
        allocationsLeft = nth;
        try {
            operation();
        } catch (const std::bad_alloc&) {
            // As may be: what counts is what is left.
        }
        if (std::exchange(allocationsLeft, 0U) != 0)
            return nth;
        check();
    }
}

TEST_F(ScriptedTest, AnEventListThatCannotGrowIsUnchanged)
{
    ASSERT_TRUE(start());
    Bench bench;
    bench.makeBuffer(64, true);
    const AutoCLObject<cl_event>& event = bench.buffer->bufferReadyEvent();
    AutoCLEventList list;
    unsigned runs = 0;
    for (unsigned size = 0; size < 14; ++size) { // grows at 0, 1, 2, 3, 4, 6, 9 and 13
        const cl_event* array = list.array();
        runs += untilMemorySuffices([&] { list.add(event); },
                                    [&] {
                                        EXPECT_EQ(list.size(), size);
                                        EXPECT_EQ(list.array(), array);
                                    });
    }
    EXPECT_EQ(runs, 14U + 8U);

    AutoCLEventList target;
    target.add(event);
    const auto assign = [&] { target = list; };
    EXPECT_EQ(untilMemorySuffices(assign, [&] { EXPECT_EQ(target.size(), 1U); }), 2U);
}

TEST_F(ScriptedTest, AFailedBuildGoesWhereverMemoryRunsOut)
{
    ASSERT_TRUE(start());
    Bench bench;
    bench.makeStore();
    const Lines before = runtime().balance();
    const auto build = [&] {
        bench.store->getKernelFromString("#error", "program", "", "skin", nullptr);
    };
    EXPECT_GT(untilMemorySuffices(build, [&] { EXPECT_EQ(runtime().balance(), before); }), 1U);
    EXPECT_GT(std::ranges::count(warnings(), ""), 0);
}

TEST_F(ScriptedTest, AFailedRequestLeavesNothingInTheStore)
{
    ASSERT_TRUE(start());
    const auto allocationsOfAHit = [](bool afterAFailure) {
        Bench bench;
        bench.makeStore();
        if (afterAFailure) {
            runtime().plan({.function = "clCreateProgramWithSource"});
            EXPECT_EQ(bench.getKernel(), 0);
        }
        bench.getKernel();
        bench.getKernel();
        allocations = 0;
        EXPECT_EQ(bench.getKernel(), 1);
        return allocations;
    };
    EXPECT_EQ(allocationsOfAHit(true), allocationsOfAHit(false));
    EXPECT_EQ(warnings().size(), 1U);
}

#ifndef _WIN32
TEST(Allocation, AMapKeepsItsEntriesWhereAnInsertionFailsAndNoneWhereACopyDoes)
{
    TopenCLData source;
    for (std::uint64_t node = 1; node <= 5; ++node)
        source.setData(TopenCLData::sNormalsName(), Tplug(node, 0), {});
    allocationsLeft = 1;
    EXPECT_THROW(source.setData(TopenCLData::sPositionsName(), Tplug(), {}), std::bad_alloc);
    EXPECT_EQ(std::distance(source.begin(), source.end()), 5);

    TopenCLData map;
    const auto assign = [&] { map = source; };
    EXPECT_GT(untilMemorySuffices(assign, [&] { EXPECT_TRUE(map.empty()); }), 5U);
}

TEST(Allocation, AReportThatFindsNoMemoryIsNotListed)
{
    ConcurrentEventList list;
    std::vector<cl_event> events;
    events.reserve(1000);
    allocationsLeft = 1;
    EXPECT_THROW(for (;;) list.append(nullptr), std::bad_alloc);
    list.copyTo(events);
    const std::size_t listed = events.size();
    EXPECT_GE(listed, 100U);
    EXPECT_THROW(list.append(nullptr), std::bad_alloc) << "a list that could not grow stays so";
    list.clear();
    for (std::size_t index = 0; index < listed; ++index)
        list.append(nullptr);
    list.copyTo(events);
    EXPECT_EQ(events.size(), listed);
}
#endif

TEST_F(ScriptedTest, AWarningWithoutMemoryIsEmpty)
{
    allocationsLeft = 1;
    CLInternalWarning("%s", "lost");
    EXPECT_EQ(warnings(), Lines{""});
}

TEST_F(ScriptedTest, ABatchThatCannotBeRebuiltIsEmpty)
{
    ASSERT_TRUE(start());
    Bench bench;
    bench.makeManager(2);
    bench.evaluate();
    bench.createShared();
    calls();
    host().sampling = true;
    allocationsLeft = 1;
    EXPECT_THROW(bench.open(), std::bad_alloc);
    allocationsLeft = 0;
    EXPECT_EQ(callsOf("eventEnd").size(), 1U) << "the profiler's scope stayed open";
    EXPECT_EQ(bench.leaveBatch(), CL_SUCCESS); // its record says so, but it is in no batch
    EXPECT_EQ(callsOf("clEnqueueRelease"), Lines{});
    bench.open();
    EXPECT_EQ(callsOf("clEnqueueAcquire").size(), 1U) << "tried again";
}

} // namespace
} // namespace scripted
