// Kernels on a real compiler.
#include "LibraryTest.h"

#include "host/TstringArray.h"
#include "kernels/TopenCLKernelStore.h"
#include "runtime/TopenCLInfo.h"

using KernelStore = LibraryTest;

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
        return TopenCLInfo::theOne().kernelStore().getKernelFromString(
            kSource, "precision", "-DAMOUNT=3", name, &directories);
    };
    ASSERT_TRUE(TopenCLInfo::theOne().supportsDoublePrecision());
    EXPECT_NE(request("inDouble").get(), nullptr);
    EXPECT_NE(request("add").get(), nullptr) << "from the included file";
    ASSERT_TRUE(TopenCLInfo::theOne().setAllowDoublePrecisionSupport(false));
    EXPECT_NE(request("inSingle").get(), nullptr) << "other options are another program";
    EXPECT_EQ(request("inDouble").get(), nullptr);
}
