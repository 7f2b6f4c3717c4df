// Device buffers and their pool on a real runtime: the numbers that arrive, and the memory that is
// counted.
#include "LibraryTest.h"

#include "buffers/TopenCLBuffer.h"
#include "buffers/TopenCLData.h"
#include "buffers/TopenCLDataBufferPool.h"
#include "diagnostics/AutoCLEventList.h"
#include "runtime/TopenCLInfo.h"
#include "standalone/DeviceMemory.h"

#include <cstring>
#include <numeric>

namespace {

class Buffers : public LibraryTest {
protected:
    void SetUp() override { start(); }

    static cl_context context() { return TopenCLInfo::theOne().openCLContext(); }
    static cl_command_queue queue() { return TopenCLInfo::theOne().openCLCommandQueue(); }
    static std::size_t countedBytes() { return deviceMemoryUse().currentBytes; }

    static std::vector<float> ramp(std::size_t count, float first)
    {
        std::vector<float> values(count);
        std::iota(values.begin(), values.end(), first);
        return values;
    }

    static int upload(TopenCLBuffer& buffer, std::size_t firstElement, std::vector<float>& values)
    {
        return buffer.uploadDataToGPU(queue(), CL_FALSE, firstElement * sizeof(float),
                                      values.size() * sizeof(float), values.data(), 0, nullptr);
    }

    // Reads after the buffer's own last transfer.
    static std::vector<float> readBack(TopenCLBuffer& buffer, std::size_t count)
    {
        std::vector<float> values(count);
        AutoCLEventList written;
        const AutoCLObject<cl_event> lastTransfer = buffer.bufferReadyEvent();
        written.add(lastTransfer);
        EXPECT_EQ(buffer.readBackDataFromGPU(queue(), CL_TRUE, 0, count * sizeof(float),
                                             values.data(), written.size(), written.array()),
                  CL_SUCCESS);
        return values;
    }
};

} // namespace

TEST_F(Buffers, UploadsGrowWriteInPlaceAndAreCountedAndReadBack)
{
    const std::size_t counted = countedBytes();
    TopenCLBuffer buffer(context(), CL_MEM_READ_WRITE);
    std::vector<float> values = ramp(1000, 0);
    ASSERT_EQ(upload(buffer, 0, values), CL_SUCCESS);
    EXPECT_EQ(buffer.bufferReadyEvent().get(), nullptr)
        << "created with its data: nothing is pending";
    EXPECT_EQ(buffer.capacityInBytes(), 4000u);
    EXPECT_EQ(readBack(buffer, 1000), values);

    const cl_mem memory = buffer.buffer().get();
    std::vector<float> patch = ramp(10, -100);
    ASSERT_EQ(upload(buffer, 500, patch), CL_SUCCESS);
    EXPECT_EQ(buffer.buffer().get(), memory) << "what fits must not create memory";
    EXPECT_NE(buffer.bufferReadyEvent().get(), nullptr);
    std::copy(patch.begin(), patch.end(), values.begin() + 500);
    EXPECT_EQ(readBack(buffer, 1000), values);

    std::vector<float> tail = ramp(600, 7);
    ASSERT_EQ(upload(buffer, 1000, tail), CL_SUCCESS);
    EXPECT_EQ(buffer.capacityInBytes(), 6400u);
    std::vector<float> grown = readBack(buffer, 1600);
    EXPECT_EQ(std::vector<float>(grown.begin() + 1000, grown.end()), tail);
    EXPECT_EQ(countedBytes(), counted + 6400);
    buffer.reset();
    EXPECT_EQ(countedBytes(), counted);
}

TEST_F(Buffers, MappedMemoryIsWrittenAndMappedAnewWhenItGrows)
{
    constexpr std::size_t kBytes = 64;
    int error = CL_SUCCESS;
    TopenCLBuffer buffer(context(),
                         CL_MEM_READ_WRITE | CL_MEM_ALLOC_HOST_PTR | CL_MEM_HOST_WRITE_ONLY, kBytes,
                         nullptr, &error);
    ASSERT_EQ(error, CL_SUCCESS);
    for (std::size_t size = kBytes; size <= 4 * kBytes; size *= 2) {
        ASSERT_EQ(buffer.ensureBufferCapacity(size), CL_SUCCESS);
        ASSERT_NE(buffer.mappedPointer(), nullptr);
        std::memset(buffer.mappedPointer(), 1, size);
    }
}

TEST_F(Buffers, OfThePoolAreReusedAndRecordedAtTheirTrueSize)
{
    const auto describe = [](const Tplug& plug, unsigned elements, bool readOnly) {
        return TopenCLDataBufferDescriptor(plug, TopenCLData::sPositionsName(),
                                           readOnly ? TopenCLDataBufferDescriptor::kReadOnly
                                                    : TopenCLDataBufferDescriptor::kReadWrite,
                                           12, elements, 0);
    };
    const auto sizeOf = [](const TopenCLDataBuffer& buffer) {
        std::size_t size = 0;
        clGetMemObjectInfo(buffer.buffer().get(), CL_MEM_SIZE, sizeof size, &size, nullptr);
        return size;
    };
    const Tplug plug(1, 2);
    TopenCLDataBufferPool pool;
    const std::size_t counted = countedBytes();
    const TopenCLDataBuffer first = pool.createBuffer(describe(plug, 100, true));
    ASSERT_EQ(sizeOf(first), 1200u);
    EXPECT_EQ(countedBytes(), counted) << "pool memory is not counted";

    pool.releaseBuffers();
    TopenCLDataBuffer second = pool.createBuffer(describe(Tplug(3, 4), 50, false));
    EXPECT_EQ(second.buffer().get(), first.buffer().get());
    EXPECT_EQ(second.descriptor().capacityInBytes(), 1200u);
    EXPECT_EQ(second.descriptor().elementCount(), 50u);

    second.descriptor().setPermissions(TopenCLDataBufferDescriptor::kReadOnly);
    const TopenCLDataBuffer output = pool.createOutputBuffer(second, plug);
    EXPECT_EQ(sizeOf(output), 600u) << "what its elements need, not what the input's memory has";
    TopenCLData data;
    pool.collectDataForPlug(plug, data);
    EXPECT_EQ(data.getSinglePlug(), plug);
}
