// Start-up where the OpenCL library on the search path cannot be used: CTest runs it with a file
// that is no library, and with one that lacks a function.
#include "runtime/TopenCLInfo.h"

#include <gtest/gtest.h>

TEST(WithoutOpenCL, StartUpSaysSoAndStops)
{
    testing::internal::CaptureStderr();
    EXPECT_FALSE(TopenCLInfo::initialize(nullptr, nullptr, nullptr, false, false, 0x8086));
    EXPECT_EQ(testing::internal::GetCapturedStderr(),
              "OpenCL evaluator is attempting to initialize OpenCL.\n"
              "OpenCL evaluator failed to initialize clew.\n");

    // What the host may still call does nothing.
    TopenCLInfo::finish();
    TopenCLInfo::flush();
    EXPECT_FALSE(TopenCLInfo::isValid());
    EXPECT_TRUE(TopenCLInfo::IsEventComplete(nullptr));
    EXPECT_EQ(TopenCLInfo::theOne().createOpenCLCommandQueue(nullptr), nullptr);
    std::size_t global = 3;
    std::size_t local = 4;
    EXPECT_EQ(TopenCLInfo::theOne().getWorkGroupSizes(nullptr, 1, global, local),
              CL_DEVICE_NOT_FOUND);
    EXPECT_EQ(global + local, 7U) << "written in spite of the failure";
}
