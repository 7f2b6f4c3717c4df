// The growable device buffer: the calls of its operations, its limits, its copies.
#include "ScriptedTest.h"
#include "buffers/TopenCLBuffer.h"

#include <array>
#include <utility>

using namespace scripted;

namespace {

constexpr std::size_t kSize = 64;
constexpr std::size_t kLimit = std::size_t{1} << 32;
constexpr cl_mem_flags kUnmapped = CL_MEM_ALLOC_HOST_PTR | CL_MEM_HOST_NO_ACCESS;

using Descriptor = TopenCLDataBufferDescriptor;

class BufferTest : public ScriptedTest {
protected:
    void SetUp() override
    {
        ASSERT_TRUE(start());
        runtime().setHostMemory(fBytes.data(), fBytes.size());
    }
    // Differs from the queue that the library uses for its own commands.
    static cl_command_queue queue() { return info().secondaryOpenCLCommandQueue(); }
    int upload(TopenCLBuffer& buffer, std::size_t offset, std::size_t size, cl_uint waitCount = 0,
               const cl_event* waitList = nullptr)
    {
        return buffer.uploadDataToGPU(queue(), CL_FALSE, offset, size, fBytes.data(), waitCount,
                                      waitList);
    }
    // Creates memory with a pending write, whose event is event#1.
    void fill(TopenCLBuffer& buffer)
    {
        buffer.ensureBufferCapacity(kSize);
        upload(buffer, 0, 1);
        calls();
    }

    std::array<char, 256> fBytes{};
};

TEST_F(BufferTest, OperationsMakeExactCalls)
{
    TopenCLBuffer buffer(context(), CL_MEM_ALLOC_HOST_PTR); // flags 16
    const auto expect = [&](int status, std::size_t capacity, bool mapped, const Lines& expected) {
        EXPECT_EQ(status, CL_SUCCESS);
        EXPECT_EQ(calls(), expected);
        EXPECT_EQ(buffer.capacityInBytes(), capacity);
        EXPECT_EQ(host().deviceMemory, capacity);
        EXPECT_EQ(buffer.mappedPointer() != nullptr, mapped);
    };
    expect(buffer.ensureBufferCapacity(0), 0, false, {});
    expect(upload(buffer, 8, 56), 64, true,
           {"AddToDeviceMemory(64)", "clCreateBuffer(context#1, 16, 64, null) = mem#1",
            "clEnqueueMapBuffer(queue#1, mem#1, 1, 0, 0, 64, [])",
            "clEnqueueWriteBuffer(queue#2, mem#1, 0, 8, 56, host+0, []) = event#1"});
    expect(upload(buffer, 48, 16), 64, true,
           {"clReleaseEvent(event#1)",
            "clEnqueueWriteBuffer(queue#2, mem#1, 0, 48, 16, host+0, []) = event#2"});
    expect(buffer.ensureBufferCapacity(64), 64, true,
           {"clWaitForEvents([event#2])", "clReleaseEvent(event#2)"});
    expect(buffer.ensureBufferCapacity(65), 65, true,
           {"ReduceFromDeviceMemory(64)", "clEnqueueUnmapMemObject(queue#1, mem#1, []) = event#3",
            "clWaitForEvents([event#3])", "clReleaseMemObject(mem#1)", "clReleaseEvent(event#3)",
            "AddToDeviceMemory(65)", "clCreateBuffer(context#1, 16, 65, null) = mem#2",
            "clEnqueueMapBuffer(queue#1, mem#2, 1, 0, 0, 65, [])"});
    expect(upload(buffer, 0, 66), 66, false,
           {"ReduceFromDeviceMemory(65)", "clEnqueueUnmapMemObject(queue#1, mem#2, []) = event#4",
            "clWaitForEvents([event#4])", "clReleaseMemObject(mem#2)", "clReleaseEvent(event#4)",
            "AddToDeviceMemory(66)", "clCreateBuffer(context#1, 48, 66, host+0) = mem#3"});
    upload(buffer, 0, 1);
    calls();
    buffer.reset();
    expect(0, 0, false,
           {"ReduceFromDeviceMemory(66)", "clReleaseMemObject(mem#3)", "clReleaseEvent(event#5)"});
    buffer.reset();
    expect(0, 0, false, {});
    fill(buffer);
    buffer = TopenCLBuffer();
    expect(0, 0, false,
           {"ReduceFromDeviceMemory(64)", "clReleaseEvent(event#6)",
            "clEnqueueUnmapMemObject(queue#1, mem#4, []) = event#7", "clWaitForEvents([event#7])",
            "clReleaseMemObject(mem#4)", "clReleaseEvent(event#7)"});
}

TEST_F(BufferTest, MemoryIsMappedAccordingToFlags)
{
    const std::pair<cl_mem_flags, std::string> rows[] = {
        {CL_MEM_HOST_WRITE_ONLY | CL_MEM_HOST_READ_ONLY, "2"}, // writing takes precedence
        {CL_MEM_HOST_READ_ONLY, "1"},
        {CL_MEM_HOST_NO_ACCESS, ""}};
    for (const auto& [flags, mapFlags] : rows) {
        TopenCLBuffer buffer(context(), CL_MEM_ALLOC_HOST_PTR | flags);
        buffer.ensureBufferCapacity(8);
        EXPECT_EQ(buffer.mappedPointer() != nullptr, !mapFlags.empty());
        const Lines maps = callsOf("clEnqueueMapBuffer");
        EXPECT_EQ(maps.size(), mapFlags.empty() ? 0U : 1U);
        for (const std::string& map : maps)
            EXPECT_THAT(map, ::testing::EndsWith(", 1, " + mapFlags + ", 0, 8, [])"));
    }
}

TEST_F(BufferTest, InvalidSizesAndReadOnlyBuffersAreRejectedWithoutCalls)
{
    TopenCLBuffer buffer;
    fill(buffer);
    const cl_event null = nullptr; // the runtime would note it as misuse
    EXPECT_EQ(buffer.ensureBufferCapacity(kLimit), CL_INVALID_BUFFER_SIZE);
    EXPECT_EQ(upload(buffer, 0, kLimit, 1, &null), CL_INVALID_BUFFER_SIZE);
    EXPECT_EQ(upload(buffer, kLimit - 16, 16, 1, &null), CL_INVALID_BUFFER_SIZE);
    EXPECT_EQ(upload(buffer, SIZE_MAX, 2, 1, &null), CL_INVALID_BUFFER_SIZE);
    EXPECT_EQ(upload(buffer, 0, 0, 1, &null), CL_SUCCESS);
    buffer.openCLDataBuffer().descriptor().setPermissions(Descriptor::kReadOnly);
    EXPECT_EQ(upload(buffer, 0, 0), CL_SUCCESS);
    EXPECT_EQ(upload(buffer, kLimit, 1), CL_INVALID_OPERATION);
    EXPECT_EQ(calls(), Lines{});
    EXPECT_EQ(buffer.capacityInBytes(), kSize);
    EXPECT_EQ(buffer.ensureBufferCapacity(kLimit - 1), CL_SUCCESS);
    EXPECT_EQ(buffer.capacityInBytes(), kLimit - 1);
}

TEST_F(BufferTest, CopiesAndWrappersShareMemoryAndEventOnly)
{
    TopenCLBuffer buffer(context(), CL_MEM_ALLOC_HOST_PTR);
    fill(buffer);
    // The capacity is element count times element size, not the recorded one.
    TopenCLDataBuffer data = buffer.openCLDataBuffer();
    data.descriptor().setElementCount(16);
    data.descriptor().setElementSizeInBytes(4);
    data.descriptor().setCapacityInBytes(1000);
    calls();
    {
        TopenCLBuffer copy(buffer);
        TopenCLBuffer& itself = copy;
        copy = itself;
        EXPECT_EQ(calls(), (Lines{"clRetainMemObject(mem#1)", "clRetainEvent(event#1)"}));
        copy.ensureBufferCapacity(65); // memory that is counted
        copy = buffer;
        EXPECT_EQ(copy.buffer().get(), buffer.buffer().get());
        EXPECT_EQ(copy.mappedPointer(), nullptr);
        EXPECT_EQ(copy.capacityInBytes(), kSize);
        TopenCLBuffer wrapper(context(), kUnmapped, data);
        EXPECT_EQ(wrapper.capacityInBytes(), kSize);
        calls();
        wrapper.ensureBufferCapacity(65);
        EXPECT_EQ(calls(), (Lines{"clReleaseMemObject(mem#1)", "clReleaseEvent(event#1)",
                                  "AddToDeviceMemory(65)",
                                  "clCreateBuffer(context#1, 528, 65, null) = mem#3"}));
    }
    EXPECT_EQ(callsOf("clEnqueueUnmap"), Lines{});
    EXPECT_EQ(host().deviceMemory, kSize);
}

TEST_F(BufferTest, WritesPassWaitListAlwaysAndReadsOnlyWithCount)
{
    TopenCLBuffer buffer;
    fill(buffer);
    char* bytes = fBytes.data();
    const AutoCLObject<cl_event> event = buffer.bufferReadyEvent();
    const cl_event list[] = {event.get(), event.get()};
    buffer.uploadDataToGPU(queue(), CL_TRUE, 8, 4, bytes + 1, 2, list);
    buffer.readBackDataFromGPU(queue(), CL_TRUE, 4, 4, bytes + 2, 2, list);
    buffer.readBackDataFromGPU(queue(), CL_FALSE, 4, 4, bytes + 3, 0, list);
    EXPECT_EQ(
        callsOf("clEnqueue"),
        (Lines{
            "clEnqueueWriteBuffer(queue#2, mem#1, 1, 8, 4, host+1, [event#1, event#1]) = event#2",
            "clEnqueueReadBuffer(queue#2, mem#1, 1, 4, 4, host+2, [event#1, event#1]) = event#3",
            "clEnqueueReadBuffer(queue#2, mem#1, 0, 4, 4, host+3, []) = event#4"}));

    // The library passes an inconsistent wait list on; the runtime rejects it.
    upload(buffer, 0, 4, 0, list);
    expectMisuse("clEnqueueWriteBuffer: count and pointer of the wait list disagree");
}

TEST_F(BufferTest, UploadThatGrowsWaitsForWaitListFirst)
{
    TopenCLBuffer buffer;
    fill(buffer);
    const AutoCLObject<cl_event> event = buffer.bufferReadyEvent();
    const cl_event handle = event.get();
    calls();
    runtime().plan({.function = "clWaitForEvents"}); // neither reported nor returned
    EXPECT_EQ(upload(buffer, 0, 65, 1, &handle), 0);
    EXPECT_EQ(calls().front(), "clWaitForEvents([event#1]) ! -5");
    upload(buffer, 65, 4, 1, &handle);
    const Lines elsewhere = calls();
    EXPECT_EQ(elsewhere.front(), "clWaitForEvents([event#1])");
    EXPECT_THAT(elsewhere.back(), ::testing::HasSubstr("mem#3, 0, 65, 4, host+0, [event#1])"));
    upload(buffer, 0, 4, 1, &handle);
    EXPECT_EQ(callsOf("clWait"), Lines{}) << "does not grow";
}

TEST_F(BufferTest, ReadBackChecksNeitherPermissionsNorCapacity)
{
    TopenCLBuffer buffer;
    buffer.ensureBufferCapacity(8);
    buffer.openCLDataBuffer().descriptor().setPermissions(Descriptor::kReadOnly);
    // Only the runtime checks the range.
    for (const std::size_t size : {std::size_t{8}, std::size_t{0}})
        EXPECT_EQ(buffer.readBackDataFromGPU(queue(), CL_TRUE, 0, size, fBytes.data(), 0, nullptr),
                  0);
    for (const std::size_t offset : {std::size_t{4}, kLimit}) {
        buffer.readBackDataFromGPU(queue(), CL_TRUE, offset, 8, fBytes.data(), 0, nullptr);
        expectMisuse("clEnqueueReadBuffer: beyond the end");
    }
    EXPECT_EQ(callsOf("clEnqueueRead").size(), 4U);
}

TEST_F(BufferTest, EnsureCapacityReleasesEventAfterFailedWaitAndOfEmptyBuffer)
{
    TopenCLBuffer buffer;
    fill(buffer);
    TopenCLBuffer empty;
    empty.bufferReadyEvent() = buffer.bufferReadyEvent();
    EXPECT_EQ(empty.ensureBufferCapacity(kSize), 0);
    EXPECT_EQ(empty.bufferReadyEvent().get(), nullptr);
    runtime().plan({.function = "clWaitForEvents"});
    EXPECT_EQ(buffer.ensureBufferCapacity(kSize), CL_OUT_OF_RESOURCES);
    EXPECT_EQ(buffer.bufferReadyEvent().get(), nullptr);
    EXPECT_EQ(warnings(), Lines{"OpenCL error: CL_OUT_OF_RESOURCES"});
}

TEST_F(BufferTest, WrappedBufferKeepsDescriptor)
{
    const TopenCLDataBuffer data(Tplug(1, 2), TuniqueString("positions"), Descriptor::kReadOnly, 12,
                                 10, 7);
    TopenCLBuffer wrapped(context(), CL_MEM_READ_WRITE, data);
    EXPECT_TRUE(wrapped.openCLDataBuffer() == data); // name and plug
    EXPECT_EQ(wrapped.capacityInBytes(), 120U);
    EXPECT_TRUE(wrapped.openCLDataBuffer().descriptor().isReadOnly());
    const auto capacityOf = [](unsigned elementSize, unsigned count) {
        const TopenCLDataBuffer row({}, TuniqueString(), {}, elementSize, count, 7);
        return TopenCLBuffer(nullptr, 0, row).capacityInBytes();
    };
    EXPECT_EQ(capacityOf(65536, 65537), 65536U) << "a 32-bit product";
    EXPECT_EQ(capacityOf(12, 0), 0U);
}

TEST_F(BufferTest, FailedMappingKeepsCountedMemoryWithoutAddress)
{
    TopenCLBuffer buffer(context(), CL_MEM_ALLOC_HOST_PTR);
    runtime().plan({.function = "clEnqueueMapBuffer", .withHandle = true});
    EXPECT_EQ(buffer.ensureBufferCapacity(kSize), CL_OUT_OF_RESOURCES);
    EXPECT_EQ(buffer.mappedPointer(), nullptr);
    EXPECT_NE(buffer.buffer().get(), nullptr);
    EXPECT_EQ(host().deviceMemory, kSize);
}

TEST_F(BufferTest, ConstructorsCreateMemoryAndCopiesShareIt)
{
    int error = 1;
    const TopenCLBuffer filled(context(), CL_MEM_READ_WRITE, 8, fBytes.data(), &error);
    const TopenCLBuffer plain(context(), CL_MEM_READ_WRITE, 9, nullptr, &error);
    const TopenCLBuffer original(context(), CL_MEM_WRITE_ONLY); // no memory yet
    EXPECT_EQ(error, 0);
    TopenCLBuffer byDefault;
    TopenCLBuffer copy(original);
    TopenCLBuffer assigned(nullptr, CL_MEM_READ_WRITE);
    assigned = original;
    std::size_t size = 10;
    for (TopenCLBuffer* buffer : {&byDefault, &copy, &assigned})
        buffer->ensureBufferCapacity(size++);
    EXPECT_EQ(callsOf("clCreate"), (Lines{"clCreateBuffer(context#1, 33, 8, host+0) = mem#1",
                                          "clCreateBuffer(context#1, 1, 9, null) = mem#2",
                                          "clCreateBuffer(context#1, 4, 10, null) = mem#3",
                                          "clCreateBuffer(context#1, 2, 11, null) = mem#4",
                                          "clCreateBuffer(context#1, 2, 12, null) = mem#5"}));
}

TEST_F(BufferTest, ConstructorsReportFailures)
{
    const auto errorOf = [](std::size_t size) {
        int error = 1;
        TopenCLBuffer buffer(context(), CL_MEM_READ_WRITE, size, nullptr, &error);
        EXPECT_EQ(buffer.capacityInBytes(), 0U);
        runtime().clearFaults();
        return error;
    };
    runtime().plan({.function = "clCreateBuffer", .status = -6});
    EXPECT_EQ(errorOf(7), -6);
    // Neither a handle nor an error status: still a failure.
    runtime().plan({.function = "clCreateBuffer", .status = CL_SUCCESS});
    EXPECT_EQ(errorOf(7), CL_MEM_OBJECT_ALLOCATION_FAILURE);
    EXPECT_EQ(errorOf(kLimit), CL_INVALID_BUFFER_SIZE);
    EXPECT_EQ(errorOf(0), CL_INVALID_BUFFER_SIZE);
    expectMisuse("clCreateBuffer: of no bytes"); // noted by the runtime
}

} // namespace
