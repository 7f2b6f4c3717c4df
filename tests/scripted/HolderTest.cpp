// Holders of OpenCL objects and event lists: exact counts of retains and releases.
#include "Objects.h"
#include "ScriptedTest.h"
#include "buffers/TopenCLBuffer.h"
#include "diagnostics/AutoCLEventList.h"

#include <array>

using namespace scripted;

namespace {

using Mem = AutoCLObject<cl_mem>;

using HolderTest = StartedTest;

// This test examines moved-from objects.
// NOLINTBEGIN(bugprone-use-after-move,clang-analyzer-cplusplus.Move)
TEST_F(HolderTest, OperationsMakeExactCalls)
{
    Mem first = makeMem();  // mem#1
    Mem second = makeMem(); // mem#2
    EXPECT_EQ(callsOf("clRe"), Lines{}) << "adopting retained or released";

    Mem copy(first);
    EXPECT_EQ(calls(), Lines{"clRetainMemObject(mem#1)"});
    copy = first;
    Mem& itself = copy;
    copy = itself;
    copy.adopt(first.get());
    EXPECT_EQ(calls(), Lines{}) << "the same handle";
    copy = second;
    EXPECT_EQ(calls(), (Lines{"clReleaseMemObject(mem#1)", "clRetainMemObject(mem#2)"}));
    copy = Mem();
    EXPECT_EQ(calls(), Lines{"clReleaseMemObject(mem#2)"});

    Mem moved(std::move(first));
    EXPECT_EQ(first.get(), nullptr);
    moved = std::move(second);
    EXPECT_EQ(runtime().name(moved.get()), "mem#2");
    EXPECT_EQ(runtime().name(second.get()), "mem#1");
    EXPECT_EQ(calls(), Lines{}) << "moves exchange";

    moved.adopt(ocl.clCreateBuffer(context(), 1, 4, nullptr, nullptr)); // mem#3
    EXPECT_EQ(callsOf("clRe"), Lines{"clReleaseMemObject(mem#2)"});
    const Mem empty;
    second = empty;
    EXPECT_EQ(second.get(), nullptr);
    EXPECT_EQ(*moved.receive(), nullptr);
    EXPECT_EQ(calls(), (Lines{"clReleaseMemObject(mem#1)", "clReleaseMemObject(mem#3)"}));

    Mem emptied = makeMem(); // mem#4
    emptied.adopt(nullptr);
    EXPECT_EQ(emptied.get(), nullptr);
    EXPECT_EQ(callsOf("clRe"), Lines{"clReleaseMemObject(mem#4)"});
}
// NOLINTEND(bugprone-use-after-move,clang-analyzer-cplusplus.Move)

// The library copies no program; tests of its operations check the calls for the other types.
TEST_F(HolderTest, CopyOfProgramUsesCallsForPrograms)
{
    const char* source = "";
    AutoCLObject<cl_program> program;
    program.adopt(ocl.clCreateProgramWithSource(context(), 1, &source, nullptr, nullptr));
    static_cast<void>(AutoCLObject<cl_program>(program));
    EXPECT_EQ(callsOf("clRe"),
              (Lines{"clRetainProgram(program#1)", "clReleaseProgram(program#1)"}));
}

TEST_F(HolderTest, EventListBorrowsEventsInOrder)
{
    std::array<AutoCLObject<cl_event>, 3> events{makeEvent(), {}, makeEvent()};
    TopenCLBuffer buffer;
    AutoCLEventList list;
    list.add(events[1]); // empty: skipped
    list.add(buffer);
    EXPECT_EQ(list.size(), 0U);
    EXPECT_EQ(list.array(), nullptr);
    for (const auto& event : events)
        list.add(event);
    buffer.bufferReadyEvent() = events[0];
    calls();
    AutoCLEventList assigned;
    for (int i = 0; i < 4; ++i)
        assigned.add(buffer);
    for (int i = 0; i < 3; ++i)
        list.add(buffer);
    const AutoCLEventList copy(list);
    assigned = copy; // 5 events; the capacity grows from 4 to 6
    AutoCLEventList& itself = assigned;
    assigned = itself;
    const cl_event first = events[0].get();
    const std::vector<cl_event> expected{first, events[2].get(), first, first, first};
    const cl_event* storage = assigned.array();
    EXPECT_EQ(std::vector<cl_event>(storage, storage + assigned.size()), expected);
    assigned = AutoCLEventList();
    EXPECT_EQ(assigned.array(), nullptr);
    assigned = copy;
    assigned.add(buffer);
    EXPECT_EQ(assigned.array(), storage) << "sufficient storage is kept";
    EXPECT_EQ(calls(), Lines{}) << "lists count no references";
}

} // namespace
