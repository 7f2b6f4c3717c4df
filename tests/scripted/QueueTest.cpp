// Queues, events and work-group sizes.
#include "FaultBench.h"

using namespace scripted;

namespace {

using QueueTest = ScriptedTest;

TEST_F(QueueTest, FinishAndFlushCallBothQueuesInOrder)
{
    TopenCLInfo::finish(); // makes no call before start-up
    ASSERT_TRUE(start());
    TopenCLInfo::finish();
    TopenCLInfo::flush();
    EXPECT_EQ(calls(), (Lines{"clFinish(queue#1)", "clFinish(queue#2)", "clFlush(queue#1)",
                              "clFlush(queue#2)"}));
}

TEST_F(QueueTest, FinishAndFlushSkipNullSecondaryQueue)
{
    faults = {{.function = "clCreateCommandQueue", .nth = 2}};
    ASSERT_TRUE(start());
    EXPECT_EQ(warnings().size(), 1U);
    TopenCLInfo::finish();
    TopenCLInfo::flush();
    EXPECT_EQ(calls(), (Lines{"clFinish(queue#1)", "clFinish(null) ! -36", "clFlush(queue#1)",
                              "clFlush(null) ! -36"}));
    EXPECT_EQ(warnings(), Lines{});
    expectMisuse("clFinish: null");
    expectMisuse("clFlush: null");
}

TEST_F(StartedTest, CreateOpenCLCommandQueueIsInOrder)
{
    bool outOfOrder = true;
    runtime().plan({.function = "clCreateCommandQueue", .status = CL_INVALID_VALUE});
    runtime().plan({.function = "clCreateCommandQueue", .nth = 4, .withHandle = true});
    const cl_command_queue first = info().createOpenCLCommandQueue(&outOfOrder);
    EXPECT_NE(first, info().createOpenCLCommandQueue(nullptr));
    EXPECT_FALSE(outOfOrder);
    EXPECT_EQ(info().createOpenCLCommandQueue(nullptr), nullptr) << "a handle with an error status";
    EXPECT_EQ(warnings(), Lines{"OpenCL error: CL_OUT_OF_RESOURCES\n"});
    EXPECT_EQ(callsOf("clCreate"),
              (Lines{"clCreateCommandQueue(context#1, device#1, 0) ! -30",
                     "clCreateCommandQueue(context#1, device#1, 0) = queue#3",
                     "clCreateCommandQueue(context#1, device#1, 0) = queue#4",
                     "clCreateCommandQueue(context#1, device#1, 0) = queue#5 ! -5"}));
    expectLeft({"queue#3 x1", "queue#4 x1", "queue#5 x1"});
}

struct EventRow : Named {
    const char* vendor;
    std::deque<cl_int> statuses; // none: the runtime writes no status
    unsigned failing;            // the query that fails, or 0
    bool complete;
    std::size_t queries;
};

const char* const kAMD = "Advanced Micro Devices, Inc.";
const char* const kNVIDIA = "NVIDIA Corporation";
class EventQuery : public ScriptedTest, public ::testing::WithParamInterface<EventRow> {};

TEST_P(EventQuery, IsEventCompleteMakesExpectedQueries)
{
    const EventRow& row = GetParam();
    machine.platforms[0].vendor = row.vendor;
    setEnvironment("VYRA_OPENCL_PLATFORM", row.vendor);
    if (row.statuses.empty())
        machine.emptyAnswers = {CL_EVENT_COMMAND_EXECUTION_STATUS};
    ASSERT_TRUE(start());
    if (!row.statuses.empty())
        runtime().scriptEventStatuses(row.statuses);
    const AutoCLObject<cl_event> event = makeEvent();
    calls();
    if (row.failing != 0)
        runtime().plan({.function = "clGetEventInfo", .nth = row.failing});

    EXPECT_EQ(TopenCLInfo::IsEventComplete(event.get()), row.complete);
    EXPECT_EQ(calls().size(), row.queries);
    EXPECT_EQ(warnings(), row.failing ? Lines{"OpenCL error: CL_OUT_OF_RESOURCES"} : Lines{});
    EXPECT_TRUE(TopenCLInfo::IsEventComplete(nullptr));
    EXPECT_EQ(calls(), Lines{});
}
INSTANTIATE_TEST_SUITE_P(
    Queue, EventQuery,
    ::testing::Values(EventRow{"Done", kNVIDIA, {CL_COMPLETE}, 0, true, 1},
                      EventRow{"Running", kNVIDIA, {CL_RUNNING, CL_COMPLETE}, 0, false, 1},
                      EventRow{"RunningElsewhere", "Somebody", {CL_RUNNING}, 0, false, 1},
                      EventRow{"Failed", kNVIDIA, {-5}, 0, false, 1},
                      EventRow{"QueryFails", kNVIDIA, {CL_RUNNING}, 1, true, 1},
                      EventRow{"Unwritten", kNVIDIA, {}, 0, false, 1},
                      EventRow{"DoneOnAMD", kAMD, {CL_COMPLETE}, 0, true, 1},
                      EventRow{"SecondLookOnAMD", kAMD, {CL_QUEUED, CL_COMPLETE}, 0, true, 2},
                      EventRow{"RunningOnAMD", kAMD, {CL_RUNNING}, 0, false, 2},
                      EventRow{"FailedOnAMD", kAMD, {-5}, 0, false, 2},
                      EventRow{"SecondQueryFailsOnAMD", kAMD, {CL_RUNNING}, 2, true, 2}),
    ::testing::PrintToStringParamName());

struct GroupRow : Named {
    std::size_t answer;
    bool unanswered;
    std::size_t expected;
};
class WorkGroupSize : public ScriptedTest, public ::testing::WithParamInterface<GroupRow> {};

TEST_P(WorkGroupSize, IsKernelsOr256AndGlobalIsSmallestMultiple)
{
    if (GetParam().unanswered)
        machine.emptyAnswers = {CL_KERNEL_WORK_GROUP_SIZE};
    machine.platforms[0].devices[0].workGroupSize = GetParam().answer;
    ASSERT_TRUE(start());
    Bench bench;
    bench.makeStore();
    ASSERT_TRUE(bench.getKernel());
    const cl_kernel kernel = bench.kernel.get();
    const std::size_t size = GetParam().expected;
    for (const std::size_t groups : {std::size_t{1}, std::size_t{2}, std::size_t{16}}) {
        for (const std::size_t count :
             {size * groups - size + 1, size * groups - 1, size * groups}) {
            std::size_t global = 1;
            std::size_t local = 1;
            EXPECT_EQ(info().getWorkGroupSizes(kernel, count, global, local), 0);
            EXPECT_EQ(global, size * groups) << count;
            EXPECT_EQ(local, size);
        }
    }
    std::size_t none = 1;
    std::size_t local = 1;
    info().getWorkGroupSizes(kernel, 0, none, local);
    EXPECT_EQ(none, 0U);
}
INSTANTIATE_TEST_SUITE_P(Queue, WorkGroupSize,
                         ::testing::Values(GroupRow{"Answered", 64, false, 64},
                                           GroupRow{"Zero", 0, false, 256},
                                           GroupRow{"Unanswered", 64, true, 256}),
                         ::testing::PrintToStringParamName());

TEST_F(StartedTest, FailedWorkGroupQueryWritesNothing)
{
    std::size_t global = 3;
    std::size_t local = 4;
    EXPECT_EQ(info().getWorkGroupSizes(nullptr, 1, global, local), CL_INVALID_KERNEL);
    Bench bench;
    bench.makeStore();
    ASSERT_TRUE(bench.getKernel());
    runtime().plan({.function = "clGetKernelWorkGroupInfo", .status = CL_INVALID_KERNEL});
    EXPECT_EQ(info().getWorkGroupSizes(bench.kernel.get(), 1, global, local), CL_INVALID_KERNEL);
    EXPECT_EQ(warnings(), Lines{"OpenCL error: CL_INVALID_KERNEL\n"});
    EXPECT_EQ(global, 3U);
    EXPECT_EQ(local, 4U);
}

// The destructor is private to the library, so the copy stays, in static memory.
TEST_F(StartedTest, CopyOfRuntimeObjectBorrowsSameHandles)
{
    alignas(TopenCLInfo) static std::byte memory[sizeof(TopenCLInfo)];
    const TopenCLInfo* original = &info();
    auto* copy = new (memory) TopenCLInfo(info());
    EXPECT_EQ(copy->openCLContext(), context());
    EXPECT_EQ(&copy->kernelStore(), &info().kernelStore());
    EXPECT_EQ(&info(), original);
    EXPECT_TRUE(copy->setUseMinimumBufferSize(!info().useMinimumBufferSize()));
    EXPECT_NE(copy->useMinimumBufferSize(), info().useMinimumBufferSize());
    *copy = info();
    EXPECT_EQ(copy->useMinimumBufferSize(), info().useMinimumBufferSize());
    EXPECT_EQ(calls(), Lines{});
}

} // namespace
