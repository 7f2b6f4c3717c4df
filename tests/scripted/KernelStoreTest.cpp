// The kernel store: what is built, what is cached, what is handed out and given back.
#include "ScriptedTest.h"
#include "host/TstringArray.h"
#include "kernels/TopenCLKernelStore.h"
#include "runtime/TopenCLInfo.h"

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <memory>
#include <random>

using namespace scripted;

namespace {

using Kernel = AutoCLObject<cl_kernel>;

const char* const kSource = "kernel void skin() {} kernel void wave() {}";

class KernelStoreTest : public ScriptedTest {
protected:
    void startStore()
    {
        ASSERT_TRUE(start());
        const TopenCLInfo& info = TopenCLInfo::theOne();
        fStore = std::make_unique<TopenCLKernelStore>();
        fStore->initialize(info.openCLContext(), info.openCLDevice(), info.openCLProvider());
    }
    void TearDown() override
    {
        fStore.reset();
        ScriptedTest::TearDown();
        if (!fFile.empty())
            std::filesystem::remove(fFile);
    }
    Kernel fromText(const char* kernel = "skin", const char* flags = "", const char* name = "text")
    {
        return fStore->getKernelFromString(kSource, name, flags, kernel, nullptr);
    }
    // A source file of that content. It is the test's own and goes with it.
    const char* file(const std::string& content)
    {
        fFile = testing::TempDir() + "vyra-" +
                testing::UnitTest::GetInstance()->current_test_info()->name() + ".cl";
        std::ofstream(fFile, std::ios::binary) << content;
        return fFile.c_str();
    }
    std::size_t builds() { return callsOf("clBuildProgram").size(); }

    std::unique_ptr<TopenCLKernelStore> fStore;
    std::string fFile;
};

TEST_F(KernelStoreTest, AHitCreatesAnotherKernelOfTheSameProgram)
{
    startStore();
    const Kernel first = fromText();
    EXPECT_EQ(
        calls(),
        (Lines{std::string("clCreateProgramWithSource(context#1, 1, \"") + kSource +
                   "\", null) = program#1",
               "clBuildProgram(program#1, [device#1], \" -D SupportsDoublePrecision\")",
               "clGetProgramBuildInfo(program#1, device#1, 4481)",
               "clCreateKernel(program#1, \"skin\") = kernel#1", "clRetainKernel(kernel#1)"}));
    const Kernel second = fromText();
    EXPECT_EQ(calls(), (Lines{"clCreateKernel(program#1, \"skin\") = kernel#2",
                              "clRetainKernel(kernel#2)"}));
    EXPECT_NE(first.get(), second.get());
}

TEST_F(KernelStoreTest, NameAndOptionsAreTheKeyAndTheTextIsNot)
{
    startStore();
    const char* path = file(kSource);
    const Kernel kernels[] = {fStore->getKernel(path, "-DA", "skin", nullptr),
                              fStore->getKernelFromString("other", path, "-DA", "wave", nullptr),
                              fStore->getKernel(path, "-DB", "skin", nullptr)};
    EXPECT_EQ(builds(), 2U);
    for (const Kernel& kernel : kernels)
        EXPECT_NE(kernel.get(), nullptr);

    // Without double precision the options differ, and so does the key.
    TopenCLInfo::theOne().setAllowDoublePrecisionSupport(false);
    fStore->getKernel(path, "-DA", "skin", nullptr);
    EXPECT_EQ(callsOf("clBuildProgram"), Lines{"clBuildProgram(program#3, [device#1], \"-DA\")"});
}

TEST_F(KernelStoreTest, TheLastKernelGivenBackDropsTheProgram)
{
    startStore();
    Kernel first = fromText("skin");
    const Kernel second = fromText("wave");
    calls();
    EXPECT_TRUE(fStore->freeKernel(first));
    EXPECT_EQ(calls(), Lines{"clReleaseKernel(kernel#1)"});
    EXPECT_FALSE(fStore->freeKernel(first));
    EXPECT_TRUE(fStore->freeKernel(Kernel()));
    EXPECT_EQ(calls(), Lines{});
    EXPECT_TRUE(fStore->freeKernel(second));
    EXPECT_EQ(calls(), (Lines{"clReleaseKernel(kernel#2)", "clReleaseProgram(program#1)"}));
    EXPECT_EQ(runtime().references(Kind::kKernel, first.get()), 1U) << "the caller's own";
    fromText();
    EXPECT_EQ(builds(), 1U);
}

TEST_F(KernelStoreTest, KernelsComeBackInAnyOrder)
{
    startStore();
    std::mt19937 random(4); // any number: the orders only have to vary
    for (int round = 0; round < 30; ++round) {
        std::vector<Kernel> kernels(9);
        for (std::size_t i = 0; i < kernels.size(); ++i)
            kernels[i] = fromText(i % 2 ? "skin" : "wave", "", i % 3 ? "a" : "b");
        std::shuffle(kernels.begin(), kernels.end(), random);
        for (const Kernel& kernel : kernels)
            ASSERT_TRUE(fStore->freeKernel(kernel));
        kernels.clear();
        Lines alive = runtime().balance();
        std::erase_if(alive, [](const std::string& line) {
            return !line.starts_with("kernel") && !line.starts_with("program");
        });
        ASSERT_EQ(alive, Lines{});
    }
}

TEST_F(KernelStoreTest, AStoreThatGoesLeavesHandedOutKernels)
{
    startStore();
    const Kernel kernel = fromText();
    fromText("wave");
    calls();
    fStore.reset();
    EXPECT_THAT(calls(), ::testing::UnorderedElementsAre("clReleaseKernel(kernel#1)",
                                                         "clReleaseKernel(kernel#2)",
                                                         "clReleaseProgram(program#1)"));
    EXPECT_EQ(runtime().references(Kind::kKernel, kernel.get()), 1U);
}

TEST_F(KernelStoreTest, AWrongKernelNameKeepsTheBuild)
{
    startStore();
    EXPECT_EQ(fromText("missing").get(), nullptr);
    EXPECT_EQ(warnings(), Lines{"OpenCL error: CL_INVALID_KERNEL_NAME"});
    const Kernel kernel = fromText("skin");
    EXPECT_NE(kernel.get(), nullptr);
    EXPECT_EQ(builds(), 1U);
}

TEST_F(KernelStoreTest, AFailedBuildIsReportedWithItsLogAndForgotten)
{
    startStore();
    for (int attempt = 0; attempt < 2; ++attempt) {
        EXPECT_EQ(fStore->getKernelFromString("#error", "bad", "", "skin", nullptr).get(), nullptr);
        EXPECT_EQ(warnings(), (Lines{"OpenCL error: CL_BUILD_PROGRAM_FAILURE", world.buildLog}));
        EXPECT_EQ(builds(), 1U);
    }
}

TEST_F(KernelStoreTest, ABuildThatOnlyReportsFailureCounts)
{
    startStore();
    // The build says no, the status says yes: the status decides.
    runtime().plan({.function = "clGetProgramBuildInfo", .status = CL_INVALID_DEVICE});
    EXPECT_EQ(fromText().get(), nullptr);
    EXPECT_EQ(warnings().front(), "OpenCL error: CL_INVALID_DEVICE");
    EXPECT_NE(fromText().get(), nullptr);
}

TEST_F(KernelStoreTest, BeforeInitializeThereIsNoKernel)
{
    ASSERT_TRUE(start());
    fStore = std::make_unique<TopenCLKernelStore>();
    fStore->initialize(nullptr, TopenCLInfo::theOne().openCLDevice(), kNVIDIAProvider);
    EXPECT_EQ(fromText().get(), nullptr);
    EXPECT_EQ(warnings(), Lines{"OpenCL error: CL_INVALID_CONTEXT"});
    expectMisuse("clCreateProgramWithSource: null");
}

TEST_F(KernelStoreTest, UnreadableFilesGiveNoKernelAndNoWord)
{
    startStore();
    const std::string directory = testing::TempDir();
    const std::string empty = file("");
    for (const char* path : {"no/such/file.cl", empty.c_str(), directory.c_str()})
        EXPECT_EQ(fStore->getKernel(path, "", "skin", nullptr).get(), nullptr) << path;
    EXPECT_EQ(calls(), Lines{});
    file(kSource); // it is there now, and read again
    EXPECT_NE(fStore->getKernel(empty.c_str(), "", "skin", nullptr).get(), nullptr);
}

TEST_F(KernelStoreTest, SourcesAreReadUnchangedBehindThePreamble)
{
    Tstring source("before");
    ASSERT_TRUE(TopenCLInfo::oclLoadProgSource(source, file("a\r\nb\n\x1A"), "#"));
    EXPECT_EQ(std::string(source.asChar(), source.length()), "#a\r\nb\n\x1A");
    EXPECT_FALSE(TopenCLInfo::oclLoadProgSource(source, "no/such/file.cl", "#"));
    EXPECT_EQ(source.length(), 0U);
}

TEST_F(KernelStoreTest, TheResourceDirectoryIsAskedForOnce)
{
    startStore();
    TopenCLInfo& info = TopenCLInfo::theOne();
    EXPECT_STREQ(info.getAbsolutePathToResources().asChar(), "scripted/resources");
    EXPECT_EQ(&info.getAbsolutePathToResources(), &info.getAbsolutePathToResources());
    EXPECT_EQ(calls(), Lines{"getResourcesLocation()"});
}

struct OptionsRow {
    const char* name;
    const char* flags; // may be null
    std::vector<const char*> directories;
    bool doublePrecision;
    bool nvidia;
    const char* options;
};
void PrintTo(const OptionsRow& row, std::ostream* out)
{
    *out << row.name;
}

class BuildOptions : public KernelStoreTest, public ::testing::WithParamInterface<OptionsRow> {};

TEST_P(BuildOptions, ReachTheCompilerToTheCharacter)
{
    const OptionsRow& row = GetParam();
    world.platforms[0].devices[0].doublePrecision = row.doublePrecision ? CL_FP_FMA : 0;
    world.platforms[0].devices[0].driverVersion = "400.00";
    if (row.nvidia) {
        world.platforms[0].vendor = "NVIDIA Corporation";
        arguments.vendorId = 0x10DE;
    }
    startStore();
    TstringArray directories;
    for (const char* directory : row.directories)
        directories.append(directory);
    fStore->getKernelFromString(kSource, "name", row.flags, "skin", &directories);
    EXPECT_EQ(callsOf("clBuildProgram"),
              Lines{std::string("clBuildProgram(program#1, [device#1], \"") + row.options + "\")"});
}
INSTANTIATE_TEST_SUITE_P(
    KernelStore, BuildOptions,
    ::testing::Values(
        OptionsRow{"Default",
                   nullptr,
                   {},
                   false,
                   false,
                   "-cl-fast-relaxed-math -cl-mad-enable -cl-no-signed-zeros -Werror"},
        OptionsRow{"EmptyIsNotTheDefault", "", {}, false, false, ""},
        OptionsRow{"Directory", "-DFOO", {"inc"}, false, false, "-DFOO -I inc"},
        OptionsRow{"Trimmed", "", {" ab ", " a b "}, false, false, " -I ab -I \"a b\""},
        OptionsRow{"Tab", "", {"\ta\tb"}, false, false, " -I \ta\tb"},
        OptionsRow{"All",
                   nullptr,
                   {"C:/res/kernels", "  C:/My Kernels/include "},
                   true,
                   true,
                   "-cl-fast-relaxed-math -cl-mad-enable -cl-no-signed-zeros -Werror -I "
                   "C:/res/kernels -I \"C:/My Kernels/include\" -D SupportsDoublePrecision "
                   "-cl-nv-verbose"}),
    [](const auto& row) { return std::string(row.param.name); });

TEST_F(KernelStoreTest, TheVendorsOwnFlagIsNotPartOfTheKey)
{
    world.platforms[0].vendor = "NVIDIA Corporation";
    world.platforms[0].devices[0].driverVersion = "400.00";
    arguments.vendorId = 0x10DE;
    startStore();
    const Kernel first = fromText("skin", "-x");
    const Kernel second = fromText("skin", "-x -D SupportsDoublePrecision -cl-nv-verbose");
    EXPECT_EQ(builds(), 2U);
}

} // namespace
