// Growable device buffers on a real runtime: the numbers that arrive, and the memory that is
// counted.
#include "LibraryTest.h"

#include "buffers/TopenCLBuffer.h"
#include "diagnostics/AutoCLEventList.h"
#include "runtime/TopenCLInfo.h"
#include "standalone/DeviceMemory.h"

#include <cstring>
#include <limits>
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

TEST_F(Buffers, UploadGrowsWritesInPlaceAndReadsBack)
{
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
}

TEST_F(Buffers, DeviceMemoryIsCountedWhileItExists)
{
    const std::size_t before = countedBytes();
    {
        TopenCLBuffer buffer(context(), CL_MEM_READ_WRITE);
        ASSERT_EQ(buffer.ensureBufferCapacity(1000), CL_SUCCESS);
        EXPECT_EQ(countedBytes(), before + 1000);
        ASSERT_EQ(buffer.ensureBufferCapacity(5000), CL_SUCCESS);
        EXPECT_EQ(countedBytes(), before + 5000);

        TopenCLBuffer copy(buffer);
        copy.reset();
        EXPECT_EQ(countedBytes(), before + 5000) << "only the original un-counts";
        buffer.openCLDataBuffer().descriptor().setElementCount(10);
        buffer.openCLDataBuffer().descriptor().setElementSizeInBytes(12);
        TopenCLBuffer wrapping(context(), CL_MEM_READ_WRITE, buffer.openCLDataBuffer());
        EXPECT_EQ(wrapping.capacityInBytes(), 120u);
        EXPECT_EQ(countedBytes(), before + 5000);
    }
    EXPECT_EQ(countedBytes(), before);
}

TEST_F(Buffers, RefusesWhatCannotBeHeldAndKeepsWhatItHas)
{
    TopenCLBuffer buffer(context(), CL_MEM_READ_WRITE);
    std::vector<float> values = ramp(16, 1);
    ASSERT_EQ(upload(buffer, 0, values), CL_SUCCESS);
    const std::size_t counted = countedBytes();
    constexpr std::size_t kTooLarge = std::size_t{1} << 32;

    EXPECT_EQ(buffer.ensureBufferCapacity(kTooLarge), CL_INVALID_BUFFER_SIZE);
    for (const std::size_t offset : {kTooLarge - 4, std::numeric_limits<std::size_t>::max() - 3}) {
        EXPECT_EQ(buffer.uploadDataToGPU(queue(), CL_TRUE, offset, 64, values.data(), 0, nullptr),
                  CL_INVALID_BUFFER_SIZE)
            << offset;
    }
    int error = CL_SUCCESS;
    const TopenCLBuffer never(context(), CL_MEM_READ_WRITE, kTooLarge, nullptr, &error);
    EXPECT_EQ(error, CL_INVALID_BUFFER_SIZE);

    buffer.openCLDataBuffer().descriptor().setPermissions(TopenCLDataBufferDescriptor::kReadOnly);
    EXPECT_EQ(upload(buffer, 0, values), CL_INVALID_OPERATION);
    EXPECT_EQ(buffer.uploadDataToGPU(queue(), CL_TRUE, 0, 0, nullptr, 0, nullptr), CL_SUCCESS);

    EXPECT_EQ(countedBytes(), counted);
    EXPECT_EQ(readBack(buffer, 16), values);
}

TEST_F(Buffers, MappingFollowsTheAccessFlags)
{
    constexpr std::size_t kBytes = 64;
    int error = CL_SUCCESS;
    TopenCLBuffer writable(context(),
                           CL_MEM_READ_WRITE | CL_MEM_ALLOC_HOST_PTR | CL_MEM_HOST_WRITE_ONLY,
                           kBytes, nullptr, &error);
    ASSERT_EQ(error, CL_SUCCESS);
    ASSERT_NE(writable.mappedPointer(), nullptr);
    std::memset(writable.mappedPointer(), 1, kBytes);
    ASSERT_EQ(writable.ensureBufferCapacity(2 * kBytes), CL_SUCCESS)
        << "growing unmaps and maps anew";
    EXPECT_NE(writable.mappedPointer(), nullptr);

    TopenCLBuffer noAccess(context(),
                           CL_MEM_READ_WRITE | CL_MEM_ALLOC_HOST_PTR | CL_MEM_HOST_NO_ACCESS);
    ASSERT_EQ(noAccess.ensureBufferCapacity(kBytes), CL_SUCCESS);
    EXPECT_EQ(noAccess.mappedPointer(), nullptr);

    std::vector<float> values = ramp(16, 0);
    TopenCLBuffer fromHost(context(), CL_MEM_READ_WRITE | CL_MEM_ALLOC_HOST_PTR);
    ASSERT_EQ(upload(fromHost, 0, values), CL_SUCCESS);
    EXPECT_EQ(fromHost.mappedPointer(), nullptr) << "memory made from host data is not mapped";

    const TopenCLBuffer copy(writable);
    EXPECT_EQ(TopenCLBuffer(copy).mappedPointer(), nullptr)
        << "the mapping stays with the original";
}
