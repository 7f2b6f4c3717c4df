// The pool and the data map with real memory, from several threads.
#include "LibraryTest.h"

#include "buffers/TopenCLData.h"
#include "buffers/TopenCLDataBufferPool.h"
#include "runtime/TopenCLInfo.h"
#include "standalone/DeviceMemory.h"

#include <set>
#include <thread>

namespace {

class PoolAndMap : public LibraryTest {
protected:
    void SetUp() override { start(); }

    static TopenCLDataBufferDescriptor
    describe(const Tplug& plug, unsigned elements,
             TopenCLDataBufferDescriptor::Tpermissions permissions)
    {
        return {plug, TopenCLData::sPositionsName(), permissions, 12, elements, 0};
    }

    static std::size_t sizeOf(const TopenCLDataBuffer& buffer)
    {
        std::size_t size = 0;
        clGetMemObjectInfo(buffer.buffer().get(), CL_MEM_SIZE, sizeof size, &size, nullptr);
        return size;
    }

    const Tplug fPlug{1, 2};
    const Tplug fOtherPlug{3, 4};
};

} // namespace

TEST_F(PoolAndMap, MemoryIsReusedAndRecordedAtItsTrueSize)
{
    TopenCLDataBufferPool pool;
    const std::size_t counted = deviceMemoryUse().currentBytes;
    const TopenCLDataBuffer first =
        pool.createBuffer(describe(fPlug, 100, TopenCLDataBufferDescriptor::kReadOnly));
    ASSERT_EQ(sizeOf(first), 1200u);
    EXPECT_EQ(deviceMemoryUse().currentBytes, counted) << "pool memory is not counted";

    pool.releaseBuffers();
    const TopenCLDataBuffer second =
        pool.createBuffer(describe(fOtherPlug, 50, TopenCLDataBufferDescriptor::kReadWrite));
    EXPECT_EQ(second.buffer().get(), first.buffer().get());
    EXPECT_EQ(second.descriptor().capacityInBytes(), 1200u);
    EXPECT_EQ(second.descriptor().elementCount(), 50u);

    const TopenCLDataBuffer inPlace = pool.createOutputBuffer(second, fPlug);
    EXPECT_EQ(inPlace.buffer().get(), second.buffer().get())
        << "a writable input is its own output";
    TopenCLDataBuffer readOnly = second;
    readOnly.descriptor().setPermissions(TopenCLDataBufferDescriptor::kReadOnly);
    const TopenCLDataBuffer fresh = pool.createOutputBuffer(readOnly, fPlug);
    EXPECT_NE(fresh.buffer().get(), second.buffer().get());
    EXPECT_FALSE(fresh.descriptor().isReadOnly());
    EXPECT_EQ(sizeOf(fresh), 600u);

    TopenCLData data;
    pool.collectDataForPlug(fPlug, data);
    EXPECT_EQ(data.getData(TopenCLData::sPositionsName(), fPlug).buffer().get(),
              fresh.buffer().get());
    EXPECT_EQ(data.getSinglePlug(), fPlug);
}

TEST_F(PoolAndMap, ThreadsNeverShareABuffer)
{
    constexpr unsigned kThreads = 4;
    constexpr unsigned kBuffersEach = 64;
    TopenCLDataBufferPool pool;
    for (int evaluation = 0; evaluation < 3; ++evaluation) {
        std::vector<std::vector<cl_mem>> handedOut(kThreads);
        std::vector<std::thread> threads;
        for (unsigned index = 0; index < kThreads; ++index) {
            threads.emplace_back([&, index] {
                for (unsigned buffer = 0; buffer < kBuffersEach; ++buffer) {
                    const unsigned elements = 10 + (buffer * 7 + index) % 20;
                    const auto result = pool.createBuffer(
                        describe(fPlug, elements, TopenCLDataBufferDescriptor::kReadWrite));
                    EXPECT_GE(result.descriptor().capacityInBytes(), elements * 12);
                    handedOut[index].push_back(result.buffer().get());
                }
            });
        }
        for (std::thread& thread : threads)
            thread.join();
        std::set<cl_mem> distinct;
        for (const auto& memories : handedOut)
            distinct.insert(memories.begin(), memories.end());
        EXPECT_EQ(distinct.size(), std::size_t{kThreads * kBuffersEach});
        pool.releaseBuffers();
    }
}

TEST_F(PoolAndMap, ThreadsFillOneMap)
{
    constexpr std::uint64_t kThreads = 4;
    constexpr std::uint64_t kPlugsEach = 500;
    TopenCLDataBufferPool pool;
    const TopenCLDataBuffer buffer =
        pool.createBuffer(describe(fPlug, 1, TopenCLDataBufferDescriptor::kReadWrite));
    TopenCLData data;
    std::vector<std::thread> threads;
    for (std::uint64_t index = 0; index < kThreads; ++index) {
        threads.emplace_back([&, index] {
            for (std::uint64_t attribute = 0; attribute < kPlugsEach; ++attribute) {
                const Tplug plug(index, attribute);
                data.setData(TopenCLData::sNormalsName(), plug, buffer);
                EXPECT_EQ(data.getData(TopenCLData::sNormalsName(), plug).buffer().get(),
                          buffer.buffer().get());
            }
        });
    }
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_EQ(std::distance(data.begin(), data.end()),
              static_cast<std::ptrdiff_t>(kThreads * kPlugsEach));
    EXPECT_EQ(data.getSinglePlug(), Tplug::fsNULL);
    EXPECT_EQ(data.getData(TopenCLData::sPositionsName(), Tplug(0, 0)), TopenCLDataBuffer::fsNULL);

    cl_uint references = 0;
    {
        const TopenCLData copy(data);
        clGetMemObjectInfo(buffer.buffer().get(), CL_MEM_REFERENCE_COUNT, sizeof references,
                           &references, nullptr);
        EXPECT_GE(references, 2 * kThreads * kPlugsEach) << "a copy shares the memory objects";
    }
    data = TopenCLData();
    EXPECT_TRUE(data.empty());
    clGetMemObjectInfo(buffer.buffer().get(), CL_MEM_REFERENCE_COUNT, sizeof references,
                       &references, nullptr);
    EXPECT_EQ(references, 2u) << "the caller's and the pool's";
}
