// Running out of memory: what is promised to stay unchanged does, and nothing leaks or stays
// locked.
//
// A test counts the allocations of an operation and makes each of them fail in turn.
#include "FailingAllocations.h"
#include "FaultBench.h"
#include "diagnostics/AutoCLEventList.h"
#include "diagnostics/CLInternalWarning.h"
#include "interop/ConcurrentEventList.h"

#include <algorithm>
#include <functional>
#include <iterator>
#include <new>
#include <set>
#include <utility>

namespace scripted {
namespace {

struct Row : Named {
    std::function<void(Bench&)> prepare;
    std::function<int(Bench&)> run;
};

class OutOfMemory : public ScriptedTest, public ::testing::WithParamInterface<Row> {};

// A program that was built stays cached though its kernel could not be listed.
Lines withoutPrograms()
{
    Lines lines = runtime().balance();
    std::erase_if(lines, [](const std::string& line) { return line.starts_with("program"); });
    return lines;
}

TEST_P(OutOfMemory, LosesNothingAndWorksWhenTriedAgain)
{
    ASSERT_TRUE(start());
    const Lines before = runtime().balance();
    bool failed = true;
    for (unsigned nth = 1; failed; ++nth) {
        SCOPED_TRACE(nth);
        {
            Bench bench;
            GetParam().prepare(bench);
            const Lines prepared = withoutPrograms();
            allocationsLeft = nth;
            try {
                GetParam().run(bench);
                failed = false;
                EXPECT_GT(nth, 1U);
            } catch (const std::bad_alloc&) {
                EXPECT_EQ(withoutPrograms(), prepared) << "something was taken or lost";
            }
            allocationsLeft = 0;
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
        failures = 0;
        allocationsLeft = nth;
        try {
            operation();
        } catch (const std::bad_alloc&) {
            // As may be: what counts is what is left.
        }
        allocationsLeft = 0;
        if (failures == 0)
            return nth;
        check();
    }
}

// A host with its deformer. A step that finds no memory is left out; the steps after it are taken.
class Host {
public:
    Host()
    {
        fRecords.reserve(kBuffers + 2 * kCreated);
        // Without a batch there is no release: the events stay listed, as many as have room.
        fManager.PreEvaluate(fId);
        report(kReserved);
        fManager.PostEvaluate(fId);
        for (int i = 0; i < kBuffers; ++i)
            createShared();
    }
    ~Host() { WaitForGraphicsFence(); }

    // Returns the number of steps that were left out.
    int evaluate()
    {
        fLeftOut = 0;
        if (attempt([&] { fManager.PreEvaluate(fId); }))
            deform();
        else
            EXPECT_TRUE(std::ranges::none_of(runtime().takeCalls(), isAcquire));
        strikeOut({"clWaitForEvents"});
        EXPECT_NO_THROW(fManager.PostEvaluate(fId));
        strikeOut({"clWaitForEvents", "clEnqueueRelease", "glCreateSyncFromCLevent"});
        fManager.RenderingComplete();
        return fLeftOut;
    }

    // Events that should have been waited for, and were not: of acquires, of the deformer's last
    // commands, and of single releases.
    const Lines& unwaited() const { return fUnwaited; }
    // Since the last time.
    std::size_t takeFailedWaits() { return std::exchange(fFailedWaits, 0); }

private:
    static constexpr int kBuffers = 3;
    static constexpr int kCreated = 2;         // in each evaluation
    static constexpr unsigned kReserved = 100; // what a list has room for from the start
    static constexpr unsigned kReported = 150;

    static cl_command_queue queue() { return TopenCLInfo::theOne().openCLCommandQueue(); }
    static bool isAcquire(const std::string& line) { return line.starts_with("clEnqueueAcquire"); }

    template <typename Step>
    bool attempt(const Step& step)
    {
        try {
            step();
            return true;
        } catch (const std::bad_alloc&) {
            ++fLeftOut;
            return false;
        }
    }

    void deform()
    {
        AutoCLObject<cl_event> acquired;
        for (const auto* record : fRecords)
            fManager.EnqueueAcquireSharedCLBuffer(queue(), record, acquired.receive());
        expectWait(acquired.get());
        attempt([&] { report(kReported); });
        for (int i = 0; i < kCreated; ++i)
            attempt([&] { createShared(); });
        if (!fRecords.back()->fInBatch)
            useAlone(fRecords.back());
        fManager.DestroyBatchedSharedCLBuffer(fRecords.front());
        fRecords.erase(fRecords.begin());
    }

    void report(unsigned count)
    {
        for (unsigned i = 0; i < count; ++i) {
            AutoCLObject<cl_event> last;
            last.adopt(makeEvent());
            const cl_event event = last.get();
            fManager.EnqueueReleaseBatchedSharedCLBuffer(1, &event);
            expectWait(event);
        }
    }

    void expectWait(cl_event event)
    {
        const InsideRuntime notTheLibrarys;
        fUnwaited.push_back(runtime().name(event));
    }

    // Takes the calls since the last time; those of these functions wait for their events.
    void strikeOut(std::initializer_list<const char*> functions)
    {
        const InsideRuntime notTheLibrarys;
        for (const std::string& line : runtime().takeCalls()) {
            fFailedWaits += line.starts_with("clWaitForEvents") && line.ends_with("! -5") ? 1 : 0;
            if (std::ranges::any_of(functions, [&](auto* name) { return line.starts_with(name); }))
                std::erase_if(fUnwaited, [&](const std::string& event) {
                    return line.find(event + ']') != line.npos ||
                           line.find(event + ',') != line.npos;
                });
        }
    }

    void createShared()
    {
        int status = CL_SUCCESS;
        fRecords.push_back(makeShared(fManager, &status));
    }

    void useAlone(const TopenCLSharedBuffer* record)
    {
        const cl_mem mem = record->fMem.get();
        for (AutoCLObject<cl_event>& released : fReleased) {
            fManager.EnqueueAcquireSharedCLBuffer(queue(), record, nullptr);
            EXPECT_NO_THROW(fManager.EnqueueReleaseSharedCLBuffer(queue(), 1, &mem, 0, nullptr,
                                                                  released.receive()));
            expectWait(released.get());
        }
    }

    const em::Id fId{1};
    std::array<AutoCLObject<cl_event>, kReserved + 1> fReleased;
    TopenCLSharedBufferMgr fManager;
    std::vector<const TopenCLSharedBuffer*> fRecords; // the manager's
    Lines fUnwaited;
    std::size_t fFailedWaits = 0;
    int fLeftOut = 0;
};

// Memory runs out at each allocation of an evaluation in turn, for that one or for all that follow;
// waits for events succeed or fail.
class EvaluationWithoutMemory : public ScriptedTest,
                                public ::testing::WithParamInterface<std::tuple<bool, bool>> {};

TEST_P(EvaluationWithoutMemory, IsReleasedOnceLosesNothingAndTheNextIsWhole)
{
    startInModes(2, 3);
    const Lines before = runtime().balance();
    std::optional<Host> host(std::in_place);
    const auto [allLater, waitsFail] = GetParam();
    const auto evaluate = [&, &allLater = allLater, &waitsFail = waitsFail] {
        if (waitsFail)
            runtime().plan({.function = "clWaitForEvents", .onwards = true});
        allLaterFail = allLater;
        host->evaluate();
        allLaterFail = false;
        runtime().clearFaults();
        EXPECT_EQ(warnings().size(), host->takeFailedWaits());
    };
    const auto check = [&] {
        EXPECT_EQ(host->evaluate(), 0) << "steps left out of the next evaluation";
        EXPECT_EQ(host->unwaited(), Lines{});
        EXPECT_EQ(runtime().takeMisuse(), Lines{}) << "acquired twice, or released";
        host.reset();
        EXPECT_EQ(runtime().balance(), before);
        host.emplace();
    };
    EXPECT_GT(untilMemorySuffices(evaluate, check), 4U); // some of them TBB's, on Linux only
}
INSTANTIATE_TEST_SUITE_P(Allocation, EvaluationWithoutMemory,
                         ::testing::Combine(::testing::Bool(), ::testing::Bool()));

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

// A list that only grows needs more memory now and then.
TEST_F(ScriptedTest, AFailedRequestLeavesNothingInTheStore)
{
    ASSERT_TRUE(start());
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
    std::vector<cl_event> tooSmall = {nullptr};
    allocationsLeft = 1;
    EXPECT_THROW(list.copyTo(tooSmall), std::bad_alloc);
    EXPECT_TRUE(tooSmall.empty());
    list.copyTo(events);
    const std::size_t listed = events.size();
    EXPECT_GE(listed, 100U);
    EXPECT_THROW(list.append(nullptr), std::bad_alloc) << "a list that could not grow stays so";
    list.clear();
    for (std::size_t index = 0; index < 3 * listed; ++index)
        list.append(nullptr);
    list.copyTo(events);
    EXPECT_EQ(events.size(), 3 * listed) << "cleared, it grows again";
}
#endif

TEST_F(ScriptedTest, AWarningWithoutMemoryIsEmpty)
{
    allocationsLeft = 1;
    CLInternalWarning("%s", "lost");
    EXPECT_EQ(warnings(), Lines{""});
}

TEST_F(ScriptedTest, ABatchThatCannotBeRebuiltStaysAsItWas)
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
    EXPECT_THAT(calls(), ::testing::ElementsAre(::testing::StartsWith("eventBegin"), "eventEnd(5)"))
        << "the profiler's scope is closed, and nothing else was done";
    EXPECT_EQ(bench.leaveBatch(), CL_SUCCESS);
    EXPECT_EQ(callsOf("clReleaseMemObject").size(), 2U) << "the batch's and the record's";
    bench.open();
    EXPECT_EQ(callsOf("clEnqueueAcquire").size(), 1U) << "tried again";
}

} // namespace
} // namespace scripted
