// Device buffers on a real runtime: the numbers that arrive.
#include "LibraryTest.h"

#include "buffers/TopenCLBuffer.h"
#include "diagnostics/AutoCLEventList.h"
#include "runtime/TopenCLInfo.h"

#include <algorithm>
#include <numeric>
#include <span>
#include <tuple>

using Buffers = LibraryTest;

TEST_F(Buffers, UploadsFitOrGrowBuffer)
{
    const cl_command_queue queue = TopenCLInfo::theOne().openCLCommandQueue();
    TopenCLBuffer buffer(TopenCLInfo::theOne().openCLContext(), CL_MEM_READ_WRITE);
    std::vector<float> expected(1600);
    // New memory does not have the former contents.
    for (const auto& [first, count, checkedFirst, checkedCount] :
         {std::tuple(0U, 1000U, 0U, 1000U), {500U, 10U, 0U, 1000U}, {1000U, 600U, 1000U, 600U}}) {
        std::iota(expected.begin() + first, expected.begin() + first + count, -100.0F);
        ASSERT_EQ(buffer.uploadDataToGPU(queue, CL_FALSE, first * sizeof(float),
                                         count * sizeof(float), &expected[first], 0, nullptr),
                  CL_SUCCESS);
        std::vector<float> actual(checkedCount);
        AutoCLEventList written;
        const AutoCLObject<cl_event> lastTransfer = buffer.bufferReadyEvent();
        written.add(lastTransfer);
        EXPECT_EQ(buffer.readBackDataFromGPU(queue, CL_TRUE, checkedFirst * sizeof(float),
                                             checkedCount * sizeof(float), actual.data(),
                                             written.size(), written.array()),
                  CL_SUCCESS);
        EXPECT_TRUE(
            std::ranges::equal(actual, std::span(expected).subspan(checkedFirst, checkedCount)))
            << first;
    }
}
