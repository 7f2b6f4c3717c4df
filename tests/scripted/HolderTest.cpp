// Holders of OpenCL objects and event lists: exact counts of retains and releases.
#include "Objects.h"
#include "ScriptedTest.h"
#include "buffers/TopenCLBuffer.h"
#include "diagnostics/AutoCLEventList.h"

#include <array>

using namespace scripted;

namespace {

using Mem = AutoCLObject<cl_mem>;

class HolderTest : public ScriptedTest {
protected:
    void SetUp() override { ASSERT_TRUE(start()); }

    // A holder of an object whose making is nobody's concern.
    template <typename Handle>
    AutoCLObject<Handle> adopted(Handle made)
    {
        calls();
        AutoCLObject<Handle> holder;
        holder.adopt(made);
        return holder;
    }
};

TEST_F(HolderTest, EmptyHoldersMakeNoCall)
{
    Mem empty;
    Mem copy(empty);
    copy = empty;
    empty.reset();
    empty.adopt(nullptr);
    EXPECT_EQ(*empty.receive(), nullptr);
    EXPECT_EQ(calls(), Lines{});
}

// What a move leaves behind is part of what this test looks at.
// NOLINTBEGIN(bugprone-use-after-move,clang-analyzer-cplusplus.Move)
TEST_F(HolderTest, EachOperationMakesExactlyItsCalls)
{
    Mem first = adopted(makeMem());  // mem#1
    Mem second = adopted(makeMem()); // mem#2
    EXPECT_EQ(calls(), Lines{}) << "adopting retained or released";

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

    moved.adopt(makeMem()); // mem#3
    EXPECT_EQ(callsOf("clRe"), Lines{"clReleaseMemObject(mem#2)"});
    const Mem empty;
    second = empty;
    EXPECT_EQ(second.get(), nullptr);
    EXPECT_EQ(*moved.receive(), nullptr);
    EXPECT_EQ(calls(), (Lines{"clReleaseMemObject(mem#1)", "clReleaseMemObject(mem#3)"}));

    Mem emptied = adopted(makeMem()); // mem#4
    emptied.adopt(nullptr);
    EXPECT_EQ(emptied.get(), nullptr);
    EXPECT_EQ(calls(), Lines{"clReleaseMemObject(mem#4)"});
}
// NOLINTEND(bugprone-use-after-move,clang-analyzer-cplusplus.Move)

TEST_F(HolderTest, EventsKernelsAndProgramsUseTheirOwnCalls)
{
    const auto event = adopted(makeEvent());
    const auto program = adopted(makeProgram());
    const auto kernel = adopted(ocl.clCreateKernel(program.get(), "deform", nullptr));
    static_cast<void>(AutoCLObject<cl_event>(event));
    static_cast<void>(AutoCLObject<cl_kernel>(kernel));
    static_cast<void>(AutoCLObject<cl_program>(program));
    EXPECT_EQ(calls(), (Lines{"clRetainEvent(event#1)", "clReleaseEvent(event#1)",
                              "clRetainKernel(kernel#1)", "clReleaseKernel(kernel#1)",
                              "clRetainProgram(program#1)", "clReleaseProgram(program#1)"}));
}

TEST_F(HolderTest, EventListsBorrowInOrder)
{
    std::array<AutoCLObject<cl_event>, 5> events{
        adopted(makeEvent()), adopted(makeEvent()), {}, adopted(makeEvent()), adopted(makeEvent())};
    AutoCLEventList list;
    EXPECT_EQ(list.size(), 0U);
    EXPECT_EQ(list.array(), nullptr);
    list.add(events[2]); // empty: skipped
    EXPECT_EQ(list.array(), nullptr);
    for (const auto& event : events)
        list.add(event);
    list.add(events[0]);
    const AutoCLEventList copy(list);
    AutoCLEventList assigned;
    assigned.add(events[4]);
    assigned = copy;
    AutoCLEventList& itself = assigned;
    assigned = itself;

    ASSERT_EQ(assigned.size(), 5U);
    const std::vector<cl_event> expected{events[0].get(), events[1].get(), events[3].get(),
                                         events[4].get(), events[0].get()};
    EXPECT_EQ(std::vector<cl_event>(assigned.array(), assigned.array() + 5), expected);
    assigned = AutoCLEventList();
    EXPECT_EQ(assigned.array(), nullptr);
    EXPECT_EQ(calls(), Lines{}) << "lists count no references";
}

TEST_F(HolderTest, AnAssignedListGrowsByHalfAndKeepsRoomThatSuffices)
{
    const auto event = adopted(makeEvent());
    AutoCLEventList four;
    AutoCLEventList five;
    for (int i = 0; i < 4; ++i)
        four.add(event);
    for (int i = 0; i < 5; ++i)
        five.add(event);
    four = five; // room for six
    const cl_event* array = four.array();
    four.add(event);
    EXPECT_EQ(four.array(), array);
    four = five;
    EXPECT_EQ(four.array(), array);
    EXPECT_EQ(four.size(), 5U);
}

TEST_F(HolderTest, EventListsTakeTheReadyEventsOfBuffers)
{
    const cl_command_queue queue = TopenCLInfo::theOne().openCLCommandQueue();
    std::array<TopenCLBuffer, 3> buffers;
    char bytes[4] = {};
    for (TopenCLBuffer& buffer : buffers)
        buffer.ensureBufferCapacity(sizeof bytes);
    buffers[0].uploadDataToGPU(queue, CL_FALSE, 0, sizeof bytes, bytes, 0, nullptr);
    buffers[2].uploadDataToGPU(queue, CL_FALSE, 0, sizeof bytes, bytes, 0, nullptr);
    AutoCLEventList list;
    for (TopenCLBuffer& buffer : buffers)
        list.add(buffer);
    ASSERT_EQ(list.size(), 2U);
    EXPECT_EQ(list.array()[0], buffers[0].bufferReadyEvent().get());
    EXPECT_EQ(list.array()[1], buffers[2].bufferReadyEvent().get());
}

} // namespace
