// Kernels on a real compiler.
#include "LibraryTest.h"

#include "diagnostics/CLWarningSink.h"
#include "host/TstringArray.h"
#include "kernels/TopenCLKernelStore.h"
#include "runtime/TopenCLInfo.h"

#include <string>

#include <gmock/gmock.h>

namespace {

using KernelStore = LibraryTest;

// Global, because a sink is a plain function.
std::vector<std::string> warnings;

} // namespace

TEST_F(KernelStore, FailedBuildReachesSinkWithLog)
{
    const CLWarningSink before =
        setCLWarningSink([](const char* text) { warnings.emplace_back(text); });
    EXPECT_EQ(TopenCLInfo::theOne()
                  .kernelStore()
                  .getKernel(VYRA_TEST_KERNELS "/broken.cl", nullptr, "broken", nullptr)
                  .get(),
              nullptr);
    EXPECT_THAT(warnings, testing::Contains("OpenCL error: CL_BUILD_PROGRAM_FAILURE"));
    EXPECT_THAT(warnings, testing::Contains(testing::HasSubstr("undeclared_amount")));

    warnings.clear();
    EXPECT_EQ(deformKernel("subtract").get(), nullptr);
    EXPECT_THAT(warnings, testing::ElementsAre("OpenCL error: CL_INVALID_KERNEL_NAME"));
    EXPECT_NE(setCLWarningSink(before), nullptr);
    EXPECT_NE(deformKernel("add").get(), nullptr);
}

TEST_F(KernelStore, FlagsAndIncludeDirectoriesReachCompiler)
{
    constexpr const char* kSource = "#include \"deform.cl\"\n"
                                    "#ifdef SupportsDoublePrecision\n"
                                    "__kernel void inDouble(__global int* d) { d[0] = AMOUNT; }\n"
                                    "#else\n"
                                    "__kernel void inSingle(__global int* d) { d[0] = AMOUNT; }\n"
                                    "#endif\n";
    TstringArray directories;
    directories.append("  " VYRA_TEST_KERNELS " ");
    const auto request = [&](const char* name) {
        return TopenCLInfo::theOne().kernelStore().getKernelFromString(
            kSource, "precision", "-DAMOUNT=3", name, &directories);
    };
    EXPECT_NE(request("add").get(), nullptr) << "from the included file";
    if (!TopenCLInfo::theOne().supportsDoublePrecision()) {
        EXPECT_NE(request("inSingle").get(), nullptr);
        GTEST_SKIP() << "the device has no double precision, so the other program cannot be built";
    }
    EXPECT_NE(request("inDouble").get(), nullptr);
    ASSERT_TRUE(TopenCLInfo::theOne().setAllowDoublePrecisionSupport(false));
    EXPECT_NE(request("inSingle").get(), nullptr) << "other options select another program";
    EXPECT_EQ(request("inDouble").get(), nullptr);
}
