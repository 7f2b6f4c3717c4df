// Failing allocations: documented state stays unchanged, and nothing leaks or stays locked.
//
// A test makes each allocation of an operation fail in turn.
#include "FailingAllocations.h"
#include "FaultBench.h"
#include "ManagerTest.h"
#include "diagnostics/AutoCLEventList.h"
#include "interop/ConcurrentEventList.h"

#include <algorithm>
#include <iterator>
#include <new>
#include <set>

namespace scripted {
namespace {

// A built program stays cached even if its kernel could not be listed.
Lines withoutPrograms()
{
    Lines lines = runtime().balance();
    std::erase_if(lines, [](const std::string& line) { return line.starts_with("program"); });
    return lines;
}

// Requires that `run`, on a bench that is prepared, changes nothing with each of its allocations
// failing in turn, and then succeeds.
void expectRetrySucceeds(const char* what, void (*prepare)(Bench&), int (*run)(Bench&))
{
    const Lines before = runtime().balance();
    bool failed = true;
    for (unsigned nth = 1; failed; ++nth) {
        SCOPED_TRACE(testing::Message() << what << ' ' << nth);
        {
            Bench bench;
            prepare(bench);
            const Lines prepared = withoutPrograms();
            allocationsLeft = nth;
            try {
                run(bench);
                failed = false;
                EXPECT_GT(nth, 1U);
            } catch (const std::bad_alloc&) {
                EXPECT_EQ(withoutPrograms(), prepared) << "objects were leaked or released";
            }
            allocationsLeft = 0;
            EXPECT_EQ(run(bench), 1) << "retry";
        }
        EXPECT_EQ(runtime().balance(), before);
    }
}

TEST_F(StartedTest, FailedAllocationChangesNothingAndRetrySucceeds)
{
    using B = Bench;
    expectRetrySucceeds(
        "kernel", [](B& b) { b.makeStore(); }, [](B& b) { return b.getKernel(); });
    expectRetrySucceeds(
        "pool", [](B& b) { b.makePool(0); }, [](B& b) { return b.fromPool(64); });
    expectRetrySucceeds(
        "shared", [](B& b) { b.makeManager(0); }, [](B& b) { return b.createShared(); });
}

// Runs `operation` with each of its allocations failing in turn, until none does, and `check` each
// time that it ran out of memory. Returns how often it ran.
template <typename Operation, typename Check>
unsigned untilMemorySuffices(const Operation& operation, const Check& check)
{
    for (unsigned nth = 1;; ++nth) {
        failures = 0;
        allocationsLeft = nth;
        try {
            operation();
        } catch (const std::bad_alloc&) {
            // Allowed; `check` examines the state.
        }
        allocationsLeft = 0;
        if (failures == 0)
            return nth;
        check();
    }
}

// Makes every allocation fail while it exists.
struct NoMemory {
    NoMemory()
    {
        allLaterFail = true;
        allocationsLeft = 1;
    }
    ~NoMemory()
    {
        allLaterFail = false;
        allocationsLeft = 0;
    }
};

#ifndef _WIN32 // TBB's allocations cannot fail there
// Parameter: whether waits fail, too, which is reported and changes nothing else.
class FullLists : public ManagerTest, public ::testing::WithParamInterface<bool> {
protected:
    // Requires that the operation, without memory, waits for these events itself and throws
    // nothing.
    template <typename Operation>
    void expectWaits(const Lines& events, const Operation& operation)
    {
        if (GetParam())
            runtime().plan({.function = "clWaitForEvents", .onwards = true});
        {
            const NoMemory none;
            EXPECT_NO_THROW(operation());
        }
        runtime().clearFaults();
        fCalls = calls();
        const Lines waits = linesOf(fCalls, "clWaitFor");
        Lines expected;
        for (const std::string& event : events)
            expected.push_back("clWaitForEvents([" + event + (GetParam() ? "]) ! -5" : "])"));
        EXPECT_EQ(waits, expected);
        EXPECT_EQ(warnings().size(), GetParam() ? waits.size() : 0U);
    }

    Lines fCalls; // of the last operation
};

TEST_P(FullLists, FullListsMakeOperationsWaitForEvents)
{
    constexpr std::size_t kReserved = 100; // the initial capacity of a list
    const auto* leaving = startWithBuffer(1, 3);
    create();
    evaluate();                                      // event#1, event#2
    const AutoCLObject<cl_event> last = makeEvent(); // event#3
    const cl_event reported = last.get();
    const auto report = [&] { manager().EnqueueReleaseBatchedSharedCLBuffer(1, &reported); };
    for (std::size_t i = 0; i < kReserved; ++i)
        report();
    calls();
    expectWaits({"event#4"}, [&] { manager().PreEvaluate(kId); });
    EXPECT_THROW(const NoMemory none; report(), std::bad_alloc);
    EXPECT_EQ(runtime().references(Kind::kEvent, reported), 1 + kReserved);

    const TopenCLSharedBuffer* unbatched[] = {create(), create()};
    std::array<AutoCLObject<cl_event>, kReserved + 1> released;
    for (AutoCLObject<cl_event>& event : released) {
        acquire(unbatched[0]);
        const auto releaseOne = [&] { release(unbatched[0], event.receive()); };
        if (&event != &released.back())
            releaseOne();
        else
            expectWaits({"event#105"}, releaseOne);
    }
    Lines waits(kReserved, "event#3");
    waits.emplace_back("event#106"); // of the buffer's own release
    expectWaits(waits, [&] { manager().DestroyBatchedSharedCLBuffer(leaving); });
    waits.pop_back();
    expectWaits(waits, [&] { manager().PostEvaluate(kId); });
    EXPECT_THAT(fCalls,
                ::testing::Contains("clEnqueueReleaseGLObjects(queue#1, [mem#2], []) = event#107"));
    EXPECT_EQ(countOf(fCalls, "clReleaseEvent(event#3)"), kReserved);
    EXPECT_EQ(countOf(fCalls, "glWaitSync"), kReserved + 1);
    EXPECT_FALSE(unbatched[0]->fInBatch) << "there was no memory for the batch";
    evaluate();
    EXPECT_TRUE(unbatched[0]->fInBatch && unbatched[1]->fInBatch);
}
INSTANTIATE_TEST_SUITE_P(Allocation, FullLists, ::testing::Bool());
#endif

TEST_F(StartedTest, FailedGrowthLeavesEventListUnchanged)
{
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

TEST_F(StartedTest, FailedBuildIsReleasedWhenMemoryRunsOut)
{
    Bench bench;
    bench.makeStore();
    const Lines before = runtime().balance();
    const auto build = [&] {
        const auto kernel =
            bench.store->getKernelFromString("#error", "program", "", "skin", nullptr);
    };
    EXPECT_GT(untilMemorySuffices(build, [&] { EXPECT_EQ(runtime().balance(), before); }), 1U);
    EXPECT_GT(std::ranges::count(warnings(), ""), 0);
}

// A list that kept entries of failed requests would allocate from time to time.
TEST_F(StartedTest, FailedRequestStoresNothing)
{
    Bench bench;
    bench.makeStore();
    runtime().plan({.function = "clCreateProgramWithSource", .onwards = true});
    std::set<unsigned> counts;
    for (int request = 0; request < 20; ++request) {
        allocations = 0;
        EXPECT_EQ(bench.getKernel(), 0);
        counts.insert(unsigned{allocations}); // a copy: inserting allocates
    }
    EXPECT_EQ(counts.size(), 1U);
    EXPECT_EQ(warnings().size(), 20U);
}

#ifndef _WIN32
TEST(Allocation, FailedInsertionKeepsMapAndFailedCopyEmptiesIt)
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

TEST(Allocation, FailedAppendIsNotListed)
{
    ConcurrentEventList list;
    std::vector<cl_event> events;
    events.reserve(1000);
    allocationsLeft = 1;
    EXPECT_THROW(
        for (;;) { list.append(nullptr); }, std::bad_alloc);
    std::vector<cl_event> tooSmall = {nullptr};
    allocationsLeft = 1;
    EXPECT_THROW(list.copyTo(tooSmall), std::bad_alloc);
    EXPECT_TRUE(tooSmall.empty());
    list.copyTo(events);
    const std::size_t listed = events.size();
    EXPECT_GE(listed, 100U);
    EXPECT_THROW(list.append(nullptr), std::bad_alloc) << "growth is not retried before clear()";
    list.clear();
    for (std::size_t index = 0; index < 3 * listed; ++index)
        list.append(nullptr);
    list.copyTo(events);
    EXPECT_EQ(events.size(), 3 * listed) << "it grows after clear()";
}
#endif

TEST_F(StartedTest, FailedRebuildKeepsBatch)
{
    Bench bench;
    bench.makeManager(2);
    bench.evaluate();
    bench.createShared();
    calls();
    host().sampling = true;
    allocationsLeft = 1;
    EXPECT_THROW(bench.open(), std::bad_alloc);
    allocationsLeft = 0;
    EXPECT_THAT(calls(), ::testing::ElementsAre(::testing::StartsWith("eventBegin"), "eventEnd(5)"))
        << "only the profiler's scope was opened and closed";
    EXPECT_EQ(bench.leaveBatch(), CL_SUCCESS);
    EXPECT_EQ(callsOf("clReleaseMemObject").size(), 2U) << "the batch's and the record's";
    bench.open();
    EXPECT_EQ(callsOf("clEnqueueAcquire").size(), 1U) << "retry";
}

} // namespace
} // namespace scripted
