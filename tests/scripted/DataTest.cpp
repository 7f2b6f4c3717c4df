// Data buffers, the evaluation data map, and the pool.
#include "Objects.h"
#include "ScriptedTest.h"
#include "buffers/TopenCLData.h"
#include "buffers/TopenCLDataBufferPool.h"

#include <array>

using namespace scripted;

namespace {

using Descriptor = TopenCLDataBufferDescriptor;

const Tplug kPlug(1, 2);
const Tplug kOtherPlug(3, 4);
const TuniqueString kName("positions");

// Element size, element count and capacity.
std::array<unsigned, 3> numbersOf(const Descriptor& descriptor)
{
    return {descriptor.elementSizeInBytes(), descriptor.elementCount(),
            descriptor.capacityInBytes()};
}

Descriptor describe(unsigned bytes, const Tplug& plug = kPlug)
{
    return {plug, kName, Descriptor::kReadWrite, 1, bytes, 0};
}

class DataTest : public StartedTest {
protected:
    // A data buffer with memory of its own.
    static TopenCLDataBuffer makeData(const Descriptor& descriptor = describe(4))
    {
        return {descriptor, makeMem(), {}};
    }
};

TEST_F(DataTest, DescriptorsAreEqualIfNameAndPlugAre)
{
    const TopenCLDataBuffer data(describe(4));
    const TopenCLDataBuffer same({kPlug, kName, Descriptor::kReadOnly, 12, 10, 99}, makeMem(),
                                 makeEvent());
    EXPECT_TRUE(data == same && !(data != same));
    for (const TopenCLDataBuffer& other :
         {TopenCLDataBuffer(describe(4, kOtherPlug)),
          TopenCLDataBuffer(kPlug, TuniqueString("normals"), Descriptor::kReadWrite, 1, 4, 0)})
        EXPECT_TRUE(data != other && !(data == other));
}

TEST_F(DataTest, NullBufferIsEmptyAndWritable)
{
    TopenCLDataBuffer null = TopenCLDataBuffer::fsNULL;
    EXPECT_EQ(null.buffer().get(), nullptr);
    EXPECT_EQ(null.bufferReadyEvent().get(), nullptr);
    EXPECT_TRUE(null.descriptor().hasEmptyName());
    EXPECT_TRUE(null.descriptor().plug() == Tplug::fsNULL);
    EXPECT_FALSE(null.descriptor().isReadOnly());
    EXPECT_EQ(numbersOf(null.descriptor()), (std::array{0U, 0U, 0U}));
}

TEST_F(DataTest, PermissionsAreStoredUnchangedAndFoldedForOutputs)
{
    Descriptor input(kPlug, kName, Descriptor::kReadOnly, 12, 10, 99);
    EXPECT_FALSE(input.hasEmptyName());
    for (const int value : {0, 1, 7, -1}) {
        input.setPermissions(static_cast<Descriptor::Tpermissions>(value));
        const Descriptor output(kOtherPlug, input);
        EXPECT_EQ(input.isReadOnly(), value == 0);
        EXPECT_EQ(output.isReadOnly(), value == 0);
        EXPECT_TRUE(output.plug() == kOtherPlug && output.name() == kName);
        EXPECT_EQ(numbersOf(output), (std::array{12U, 10U, 99U}));
    }
}

// These tests examine moved-from objects.
// NOLINTBEGIN(bugprone-use-after-move,clang-analyzer-cplusplus.Move)
TEST_F(DataTest, CopiesAndMovesKeepEventAndDescriptor)
{
    const AutoCLObject<cl_event> event = makeEvent(); // event#1
    const AutoCLObject<cl_event> other = makeEvent();
    const AutoCLObject<cl_mem> mem = makeMem(); // mem#3, after those of the events
    const TopenCLDataBuffer source({kPlug, kName, Descriptor::kReadOnly, 12, 10, 120}, mem, event);
    const auto expectSource = [&](const TopenCLDataBuffer& data) {
        EXPECT_EQ(data.buffer().get(), mem.get());
        EXPECT_EQ(data.bufferReadyEvent().get(), event.get());
        EXPECT_TRUE(data == source && data.descriptor().isReadOnly());
        EXPECT_EQ(numbersOf(data.descriptor()), (std::array{12U, 10U, 120U}));
    };
    expectSource(source);
    calls();
    static_cast<void>(TopenCLDataBuffer(source));
    EXPECT_EQ(calls(), (Lines{"clRetainMemObject(mem#3)", "clRetainEvent(event#1)",
                              "clReleaseEvent(event#1)", "clReleaseMemObject(mem#3)"}));

    TopenCLDataBuffer assigned;
    assigned = source;
    assigned.setBuffer(mem, 120);
    expectSource(assigned);
    assigned.setBufferReadyEvent(event);
    calls();
    TopenCLDataBuffer moved(std::move(assigned));
    expectSource(moved);
    EXPECT_EQ(assigned.buffer().get(), nullptr);
    EXPECT_EQ(assigned.bufferReadyEvent().get(), nullptr);
    TopenCLDataBuffer target(describe(4), {}, other);
    calls();
    target = std::move(moved);
    expectSource(target);
    EXPECT_EQ(moved.bufferReadyEvent().get(), other.get());
    EXPECT_EQ(calls(), Lines{}) << "moves transfer or exchange handles";

    TopenCLData data;
    data.setData(kName, kPlug, TopenCLDataBuffer(describe(4), {}, other));
    data.setData(kName, kPlug, source);
    expectSource(data.getData(kName, kPlug));
}
// NOLINTEND(bugprone-use-after-move,clang-analyzer-cplusplus.Move)

TEST_F(DataTest, DataMapKeepsOneBufferPerKey)
{
    TopenCLData data;
    EXPECT_TRUE(data.empty());
    EXPECT_TRUE(data.getSinglePlug() == Tplug::fsNULL);
    EXPECT_EQ(&data.getData(kName, kPlug), &TopenCLDataBuffer::fsNULL);
    data.setData(kName, kPlug, makeData()); // mem#1
    EXPECT_EQ(&data.getData(kName, Tplug::fsNULL), &TopenCLDataBuffer::fsNULL);
    data.setData(kName, kPlug, makeData()); // mem#2 replaces it
    EXPECT_EQ(runtime().name(data.getData(kName, kPlug).buffer().get()), "mem#2");
    EXPECT_EQ(callsOf("clReleaseMemObject(mem#1)").size(), 3U); // its temporaries and the map's

    data.setData(TopenCLData::sNormalsName(), kPlug, makeData());
    EXPECT_TRUE(data.getSinglePlug() == kPlug);
    TopenCLData copy(data);
    EXPECT_EQ(std::distance(copy.begin(), copy.end()), 2);
    EXPECT_EQ(runtime().references(Kind::kMem, copy.getData(kName, kPlug).buffer().get()), 2U);
    for (std::uint64_t node = 10; node < 100; ++node) { // at any position of the map
        TopenCLData severalPlugs(copy);
        severalPlugs.setData(TuniqueString(std::to_string(node).c_str()), Tplug(node, node), {});
        EXPECT_TRUE(severalPlugs.getSinglePlug() == Tplug::fsNULL);
    }
    data.setData(kName, kOtherPlug, makeData());
    EXPECT_TRUE(copy.getSinglePlug() == kPlug) << "a copy is independent";
    TopenCLData& itself = data;
    data = itself;
    EXPECT_EQ(std::distance(data.cbegin(), data.cend()), 3);
    data = copy;
    EXPECT_EQ(&data.getData(kName, kOtherPlug), &TopenCLDataBuffer::fsNULL);
}

// An independent implementation of the hash.
TEST_F(DataTest, KeyHashFollowsFormula)
{
    for (const char* text : {"", "positions", "normalIdxToPositionIdx"}) {
        const TuniqueString name(text);
        for (const Tplug& plug : {kPlug, kOtherPlug, Tplug::fsNULL}) {
            std::uint64_t folded = 14695981039346656037ULL;
            std::uint64_t bytes = name.hash();
            for (int i = 0; i < 8; ++i, bytes /= 256)
                folded = (folded ^ bytes % 256) * 1099511628211ULL;
            const std::uint64_t h = plug.hash();
            EXPECT_EQ(TopenCLData::KeyHash{}({name, plug}),
                      h ^ (folded + 2654435769ULL + h * 64 + h / 4));
        }
    }
}

TEST_F(DataTest, PoolReturnsBestFitAndFirstOfEquals)
{
    TopenCLDataBufferPool pool;
    const auto expectBuffers = [&](const std::vector<std::pair<unsigned, std::string>>& rows) {
        for (const auto& [bytes, expected] : rows) {
            const TopenCLDataBuffer made = pool.createBuffer(describe(bytes));
            EXPECT_EQ(runtime().name(made.buffer().get()) + " of " +
                          std::to_string(made.descriptor().capacityInBytes()),
                      expected);
        }
        pool.releaseBuffers();
    };
    calls();
    expectBuffers({{200, "mem#1 of 200"},
                   {50, "mem#2 of 50"},
                   {100, "mem#3 of 100"},
                   {50, "mem#4 of 50"},
                   {0, "null of 0"}});
    EXPECT_EQ(callsOf("clCreate"), (Lines{"clCreateBuffer(context#1, 1, 200, null) = mem#1",
                                          "clCreateBuffer(context#1, 1, 50, null) = mem#2",
                                          "clCreateBuffer(context#1, 1, 100, null) = mem#3",
                                          "clCreateBuffer(context#1, 1, 50, null) = mem#4"}));
    expectBuffers({{60, "mem#3 of 100"}, {51, "mem#1 of 200"}, {50, "mem#2 of 50"}});
    // The latest released buffer of a size is the last one that is used again.
    expectBuffers({{1, "mem#4 of 50"}, {50, "mem#2 of 50"}, {0, "null of 0"}, {0, "mem#3 of 100"}});
    EXPECT_EQ(callsOf("clCreate"), Lines{});
    EXPECT_EQ(host().deviceMemory, 0U) << "memory of the pool is not counted";
}

TEST_F(DataTest, PoolBufferHasRequestedDescriptor)
{
    TopenCLDataBufferPool pool;
    const Descriptor wanted[] = {
        {kPlug, kName, Descriptor::kReadOnly, 12, 10, 7},
        {kOtherPlug, TuniqueString("normals"), Descriptor::kReadWrite, 6, 20, 0},
        {kPlug, kName, Descriptor::kReadOnly, 65536, 65537, 0}, // a 32-bit product
    };
    for (const Descriptor& descriptor : wanted) {
        const TopenCLDataBuffer made = pool.createBuffer(descriptor);
        EXPECT_TRUE(made == TopenCLDataBuffer(descriptor)); // name and plug
        EXPECT_EQ(made.descriptor().isReadOnly(), descriptor.isReadOnly());
        EXPECT_EQ(made.descriptor().elementSizeInBytes(), descriptor.elementSizeInBytes());
        EXPECT_EQ(made.descriptor().elementCount(), descriptor.elementCount());
        EXPECT_EQ(runtime().references(Kind::kMem, made.buffer().get()), 2U)
            << "the result's and the pool's";
        pool.releaseBuffers();
    }
    EXPECT_EQ(callsOf("clCreate"), (Lines{"clCreateBuffer(context#1, 1, 120, null) = mem#1",
                                          "clCreateBuffer(context#1, 1, 65536, null) = mem#2"}));
}

TEST_F(DataTest, OutputReusesWritableInputElsePoolMemory)
{
    TopenCLDataBufferPool pool;
    TopenCLDataBuffer input = makeData({kPlug, kName, Descriptor::kReadWrite, 12, 10, 130});
    input.bufferReadyEvent() = makeEvent();
    const TopenCLDataBuffer inPlace = pool.createOutputBuffer(input, kOtherPlug);
    EXPECT_EQ(numbersOf(inPlace.descriptor()), (std::array{12U, 10U, 130U}));
    EXPECT_TRUE(inPlace.descriptor().name() == kName && !inPlace.descriptor().isReadOnly());
    EXPECT_TRUE(inPlace.descriptor().plug() == kOtherPlug);
    EXPECT_EQ(inPlace.bufferReadyEvent().get(), input.bufferReadyEvent().get());
    EXPECT_EQ(inPlace.buffer().get(), input.buffer().get());
    const auto collected = [&] {
        TopenCLData data;
        pool.collectDataForPlug(kOtherPlug, data);
        return data.getData(kName, kOtherPlug).buffer().get();
    };
    EXPECT_EQ(collected(), nullptr) << "in-place outputs are not in the pool";

    input.descriptor().setPermissions(Descriptor::kReadOnly);
    const TopenCLDataBuffer pooled = pool.createOutputBuffer(input, kOtherPlug);
    EXPECT_NE(pooled.buffer().get(), input.buffer().get());
    EXPECT_FALSE(pooled.descriptor().isReadOnly());
    EXPECT_EQ(collected(), pooled.buffer().get());
    const TopenCLDataBuffer later =
        pool.createBuffer(pooled); // same name and plug: the later one is collected
    EXPECT_EQ(collected(), later.buffer().get());
    pool.createBuffer(describe(4)); // of another plug
    EXPECT_EQ(collected(), later.buffer().get());
    pool.releaseBuffers();
    EXPECT_EQ(collected(), nullptr);
}

TEST_F(DataTest, BufferWithoutMemoryStaysOutOfPool)
{
    TopenCLDataBufferPool pool;
    runtime().plan({.function = "clCreateBuffer"});
    const TopenCLDataBuffer failed = pool.createBuffer(describe(50));
    EXPECT_EQ(failed.buffer().get(), nullptr);
    EXPECT_EQ(failed.descriptor().capacityInBytes(), 50U);
    pool.releaseBuffers();
    EXPECT_NE(pool.createBuffer(describe(50)).buffer().get(), nullptr);
}

} // namespace
