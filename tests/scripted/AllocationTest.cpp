// Running out of memory: what is promised to stay unchanged does, and nothing leaks or stays
// locked.
//
// This file replaces the program's operator new. A test counts the allocations of an operation and
// makes each of them fail in turn; the scripted runtime's own are left out.
#include "FaultBench.h"
#include "diagnostics/AutoCLEventList.h"

#include <cstdlib>
#include <functional>
#include <new>

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

void* operator new(std::size_t size)
{
    void* memory = nextFails() ? nullptr : std::malloc(size ? size : 1);
    if (!memory)
        throw std::bad_alloc();
    return memory;
}
// A sanitizer's own would not come by.
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

TEST_F(ScriptedTest, AnEventListThatCannotGrowIsUnchanged)
{
    ASSERT_TRUE(start());
    Bench bench;
    bench.makeBuffer(64, true);
    AutoCLEventList list;
    unsigned refused = 0;
    while (list.size() < 14) { // grows at 0, 1, 2, 3, 4, 6, 9 and 13
        const unsigned size = list.size();
        const cl_event* array = list.array();
        allocationsLeft = 1;
        try {
            list.add(bench.buffer->bufferReadyEvent());
        } catch (const std::bad_alloc&) {
            ++refused;
            EXPECT_EQ(list.size(), size);
            EXPECT_EQ(list.array(), array);
            allocationsLeft = 0;
            list.add(bench.buffer->bufferReadyEvent());
        }
        allocationsLeft = 0;
    }
    EXPECT_EQ(refused, 8U);

    AutoCLEventList target;
    target.add(bench.buffer->bufferReadyEvent());
    allocationsLeft = 1;
    EXPECT_THROW(target = list, std::bad_alloc);
    allocationsLeft = 0;
    EXPECT_EQ(target.size(), 1U);
}

} // namespace
} // namespace scripted
