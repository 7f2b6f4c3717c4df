// What the warnings tell of a program that cannot be built. The sink is internal, so that this
// links the library's objects.
#include "LibraryTest.h"

#include "diagnostics/CLWarningSink.h"
#include "kernels/TopenCLKernelStore.h"
#include "runtime/TopenCLInfo.h"

#include <gmock/gmock.h>

namespace {

using BuildLog = LibraryTest;

// The sink is a plain function, so what it collects is the process's.
std::vector<std::string> collectedWarnings;

} // namespace

TEST_F(BuildLog, SaysWhyAProgramDoesNotCompile)
{
    setCLWarningSink([](const char* text) { collectedWarnings.emplace_back(text); });
    EXPECT_EQ(TopenCLInfo::theOne()
                  .kernelStore()
                  .getKernel(VYRA_TEST_KERNELS "/broken.cl", nullptr, "broken", nullptr)
                  .get(),
              nullptr);
    EXPECT_THAT(collectedWarnings, testing::Contains("OpenCL error: CL_BUILD_PROGRAM_FAILURE"));
    EXPECT_THAT(collectedWarnings, testing::Contains(testing::HasSubstr("undeclared_amount")));

    collectedWarnings.clear();
    EXPECT_EQ(deformKernel("subtract").get(), nullptr);
    EXPECT_THAT(collectedWarnings, testing::ElementsAre("OpenCL error: CL_INVALID_KERNEL_NAME"));
    setCLWarningSink(nullptr);
    EXPECT_NE(deformKernel("add").get(), nullptr);
}
