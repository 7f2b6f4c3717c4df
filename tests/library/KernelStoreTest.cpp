// Kernels from real source files on a real compiler.
#include "LibraryTest.h"

#include "host/TstringArray.h"
#include "kernels/TopenCLKernelStore.h"
#include "runtime/TopenCLInfo.h"

#include <filesystem>
#include <fstream>

namespace {

class KernelStore : public LibraryTest {
protected:
    void SetUp() override { start(); }

    static TopenCLKernelStore& store() { return TopenCLInfo::theOne().kernelStore(); }
};

} // namespace

TEST_F(KernelStore, AProgramGoesWithItsLastKernelAndIsReadAnew)
{
    const std::filesystem::path path =
        std::filesystem::temp_directory_path() / "vyra-kernel-store-test.cl";
    std::ofstream(path) << "__kernel void before(__global int* data) { data[0] = 1; }\n";
    const auto request = [&](const char* name) {
        return store().getKernel(path.string().c_str(), nullptr, name, nullptr);
    };
    AutoCLObject<cl_kernel> kernel = request("before");
    ASSERT_NE(kernel.get(), nullptr);
    std::ofstream(path) << "__kernel void after(__global int* data) { data[0] = 2; }\n";
    EXPECT_EQ(request("after").get(), nullptr)
        << "the cached program serves while its kernel is out";
    EXPECT_TRUE(store().freeKernel(kernel));
    EXPECT_NE(request("after").get(), nullptr);
    std::filesystem::remove(path);
}

TEST_F(KernelStore, FlagsIncludeDirectoriesAndPrecisionReachTheCompiler)
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
        return store().getKernelFromString(kSource, "precision", "-DAMOUNT=3", name, &directories);
    };
    ASSERT_TRUE(TopenCLInfo::theOne().supportsDoublePrecision());
    EXPECT_NE(request("inDouble").get(), nullptr);
    EXPECT_NE(request("add").get(), nullptr) << "from the included file";
    ASSERT_TRUE(TopenCLInfo::theOne().setAllowDoublePrecisionSupport(false));
    EXPECT_NE(request("inSingle").get(), nullptr) << "other options are another program";
    EXPECT_EQ(request("inDouble").get(), nullptr);
}
