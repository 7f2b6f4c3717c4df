// Device buffers and their pool on a real runtime: the numbers that arrive, and memory of the right
// size.
#include "LibraryTest.h"

#include "buffers/TopenCLBuffer.h"
#include "buffers/TopenCLData.h"
#include "buffers/TopenCLDataBufferPool.h"
#include "diagnostics/AutoCLEventList.h"
#include "runtime/TopenCLInfo.h"

#include <algorithm>
#include <cstring>
#include <numeric>

namespace {

class Buffers : public LibraryTest {
protected:
    static cl_context context() { return TopenCLInfo::theOne().openCLContext(); }
    static cl_command_queue queue() { return TopenCLInfo::theOne().openCLCommandQueue(); }

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
    static std::vector<float> readBack(TopenCLBuffer& buffer, std::size_t firstElement,
                                       std::size_t count)
    {
        std::vector<float> values(count);
        AutoCLEventList written;
        const AutoCLObject<cl_event> lastTransfer = buffer.bufferReadyEvent();
        written.add(lastTransfer);
        EXPECT_EQ(buffer.readBackDataFromGPU(queue(), CL_TRUE, firstElement * sizeof(float),
                                             count * sizeof(float), values.data(), written.size(),
                                             written.array()),
                  CL_SUCCESS);
        return values;
    }
};

} // namespace

TEST_F(Buffers, HoldWhatIsUploadedIntoThemAndBehindTheirEnd)
{
    TopenCLBuffer buffer(context(), CL_MEM_READ_WRITE);
    std::vector<float> values = ramp(1000, 0);
    ASSERT_EQ(upload(buffer, 0, values), CL_SUCCESS);
    EXPECT_EQ(readBack(buffer, 0, 1000), values);

    std::vector<float> patch = ramp(10, -100);
    ASSERT_EQ(upload(buffer, 500, patch), CL_SUCCESS);
    std::ranges::copy(patch, values.begin() + 500);
    EXPECT_EQ(readBack(buffer, 0, 1000), values);

    std::vector<float> tail = ramp(600, 7);
    ASSERT_EQ(upload(buffer, 1000, tail), CL_SUCCESS);
    EXPECT_EQ(readBack(buffer, 1000, 600), tail);
}

TEST_F(Buffers, MappedMemoryIsWrittenAndMappedAnewWhenItGrows)
{
    TopenCLBuffer buffer(context(),
                         CL_MEM_READ_WRITE | CL_MEM_ALLOC_HOST_PTR | CL_MEM_HOST_WRITE_ONLY);
    for (const std::size_t size : {64U, 128U, 256U}) {
        ASSERT_EQ(buffer.ensureBufferCapacity(size), CL_SUCCESS);
        ASSERT_NE(buffer.mappedPointer(), nullptr);
        std::memset(buffer.mappedPointer(), 1, size);
    }
}

TEST_F(Buffers, OfThePoolAreReusedAndOutputsHaveTheRoomOfTheirElements)
{
    const Tplug plug(1, 2);
    const TopenCLDataBufferDescriptor hundred(plug, TopenCLData::sPositionsName(),
                                              TopenCLDataBufferDescriptor::kReadOnly, 12, 100, 0);
    TopenCLDataBufferDescriptor fifty = hundred;
    fifty.setElementCount(50);
    TopenCLDataBufferPool pool;
    const TopenCLDataBuffer first = pool.createBuffer(hundred);
    pool.releaseBuffers();
    const TopenCLDataBuffer second = pool.createBuffer(fifty);
    EXPECT_EQ(second.buffer().get(), first.buffer().get());
    const TopenCLDataBuffer output = pool.createOutputBuffer(second, Tplug(3, 4));
    for (const auto& [buffer, expected] : {std::pair(second, 1200U), {output, 600U}}) {
        std::size_t bytes = 0;
        clGetMemObjectInfo(buffer.buffer().get(), CL_MEM_SIZE, sizeof bytes, &bytes, nullptr);
        EXPECT_EQ(bytes, expected);
        EXPECT_EQ(buffer.descriptor().capacityInBytes(), expected);
    }
    TopenCLData data;
    pool.collectDataForPlug(plug, data);
    EXPECT_EQ(data.getSinglePlug(), plug);
    EXPECT_EQ(data.getData(TopenCLData::sPositionsName(), plug).buffer().get(),
              first.buffer().get());
}
