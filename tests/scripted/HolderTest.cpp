// Holders of OpenCL objects and event lists: exact counts of retains and releases.
#include "Objects.h"
#include "ScriptedTest.h"
#include "buffers/TopenCLBuffer.h"
#include "diagnostics/AutoCLEventList.h"

#include <array>

using namespace scripted;

namespace {

using Mem = AutoCLObject<cl_mem>;

class HolderTest : public StartedTest {
protected:
    // Returns a holder of a new object; its creation is not in the log.
    template <typename Handle>
    AutoCLObject<Handle> adopted(Handle made)
    {
        calls();
        AutoCLObject<Handle> holder;
        holder.adopt(made);
        return holder;
    }
};

// This test examines moved-from objects.
// NOLINTBEGIN(bugprone-use-after-move,clang-analyzer-cplusplus.Move)
TEST_F(HolderTest, OperationsMakeExactCalls)
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

TEST_F(HolderTest, EachHandleTypeUsesItsOwnCalls)
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

TEST_F(HolderTest, EventListBorrowsEventsInOrder)
{
    std::array<AutoCLObject<cl_event>, 3> events{adopted(makeEvent()), {}, adopted(makeEvent())};
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
    list.add(buffer);
    const AutoCLEventList copy(list);
    AutoCLEventList assigned;
    assigned.add(events[2]);
    assigned = copy;
    AutoCLEventList& itself = assigned;
    assigned = itself;
    ASSERT_EQ(assigned.size(), 3U);
    const std::vector<cl_event> expected{events[0].get(), events[2].get(), events[0].get()};
    EXPECT_EQ(std::vector<cl_event>(assigned.array(), assigned.array() + 3), expected);
    const cl_event* storage = assigned.array();
    assigned = AutoCLEventList();
    EXPECT_EQ(assigned.array(), nullptr);
    assigned = copy;
    EXPECT_EQ(assigned.array(), storage) << "sufficient storage is kept";
    EXPECT_EQ(calls(), Lines{}) << "lists count no references";
}

} // namespace
