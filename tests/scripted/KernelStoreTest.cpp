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

TstringArray arrayOf(const std::vector<const char*>& texts)
{
    TstringArray array;
    for (const char* text : texts)
        array.append(text);
    return array;
}

class KernelStoreTest : public ScriptedTest {
protected:
    void SetUp() override
    {
        ASSERT_TRUE(start());
        makeStore(kIntelProvider);
    }
    void makeStore(OpenCLProvider provider)
    {
        const TopenCLInfo& info = TopenCLInfo::theOne();
        fStore = std::make_unique<TopenCLKernelStore>();
        fStore->initialize(info.openCLContext(), info.openCLDevice(), provider);
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

// A runtime's fault, within one program or across two.
TEST_F(KernelStoreTest, AHandleReturnedTwiceIsGivenBackTwice)
{
    for (const char* secondProgram : {"text", "other"}) {
        SCOPED_TRACE(secondProgram);
        const Kernel first = fromText();
        runtime().scriptNextKernel(first.get());
        const Kernel second = fromText("skin", "", secondProgram);
        ASSERT_EQ(second.get(), first.get());
        builds();
        EXPECT_TRUE(fStore->freeKernel(first));
        EXPECT_EQ(runtime().references(Kind::kKernel, first.get()), 3U);
        EXPECT_TRUE(fStore->freeKernel(second));
        EXPECT_FALSE(fStore->freeKernel(second));
        const Kernel third = fromText();
        EXPECT_EQ(builds(), 1U) << "the program went with its last kernel";
        EXPECT_TRUE(fStore->freeKernel(third));
    }
}

TEST_F(KernelStoreTest, AHitCreatesAnotherKernelOfTheSameProgram)
{
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
    constexpr const char* kLong = "-DA -D THE_SAME_ENDING";
    const struct {
        const char* name;
        const char* flags;
        std::vector<const char*> directories; // options, too
        std::size_t builds;
    } rows[] = {{"name", "-DA", {}, 1},
                {"name", "-DB", {}, 1},
                {"name", "-DA", {"a"}, 1},
                {"name", "-DA", {"b"}, 1},
                {"name", "-DA", {"a", "b"}, 1},
                {"name", "-DA", {"b", "a"}, 1},
                {"name", "-DA", {"a", "c"}, 1},
                {"name", "-DA -I a", {}, 0}, // in other words
                {"name", "", {}, 1},
                {"name", nullptr, {}, 1},
                {"a/the-same-ending.cl", kLong, {}, 1},
                {"a/the-same-ending.cl", "-DB -D THE_SAME_ENDING", {}, 1},
                {"b/the-same-ending.cl", kLong, {}, 1}};
    for (const auto& [name, flags, list, expected] : rows) {
        const TstringArray directories = arrayOf(list);
        fStore->getKernelFromString(kSource, name, flags, "skin", &directories);
        EXPECT_EQ(builds(), expected) << name << flags;
    }
    // Where the name has a program already, no file is looked for.
    for (const auto& [name, flags, list, expected] : rows) {
        const TstringArray directories = arrayOf(list);
        EXPECT_NE(fStore->getKernel(name, flags, "wave", &directories).get(), nullptr) << name;
    }
    EXPECT_NE(fStore->getKernel("name", "-DA -I b", "wave", nullptr).get(), nullptr);
    EXPECT_EQ(builds(), 0U);
    // Without double precision the options differ, and so does the key.
    TopenCLInfo::theOne().setAllowDoublePrecisionSupport(false);
    fromText("skin", "-DA", "name");
    EXPECT_EQ(callsOf("clBuildProgram"), Lines{"clBuildProgram(program#13, [device#1], \"-DA\")"});
}

TEST_F(KernelStoreTest, TheLastKernelGivenBackDropsTheProgram)
{
    const TstringArray folders = arrayOf({"a"});
    const auto inOtherWords = [&](const char* kernel) {
        return fStore->getKernelFromString(kSource, "text", "", kernel, &folders);
    };
    const Kernel first = fromText("skin", " -I a");
    const Kernel second = inOtherWords("wave");
    calls();
    EXPECT_TRUE(fStore->freeKernel(first));
    EXPECT_EQ(calls(), Lines{"clReleaseKernel(kernel#1)"});
    EXPECT_FALSE(fStore->freeKernel(first));
    EXPECT_TRUE(fStore->freeKernel(Kernel()));
    EXPECT_EQ(calls(), Lines{});
    EXPECT_TRUE(fStore->freeKernel(second));
    EXPECT_EQ(calls(), (Lines{"clReleaseKernel(kernel#2)", "clReleaseProgram(program#1)"}));
    EXPECT_EQ(runtime().references(Kind::kKernel, first.get()), 1U) << "the caller's own";
    // The program is forgotten in all words, whichever it is asked for in next.
    for (const bool other : {true, false, true}) {
        const Kernel kernel = other ? inOtherWords("skin") : fromText("skin", " -I a");
        EXPECT_EQ(builds(), 1U);
        for (const Kernel& more : {inOtherWords("wave"), fromText("wave", " -I a"), kernel})
            EXPECT_TRUE(fStore->freeKernel(more));
    }
}

TEST_F(KernelStoreTest, KernelsComeBackInAnyOrder)
{
    const Lines before = runtime().balance();
    std::mt19937 random(4); // any number: the orders only have to vary
    for (int round = 0; round < 30; ++round) {
        std::vector<Kernel> kernels(9);
        for (std::size_t i = 0; i < kernels.size(); ++i)
            kernels[i] = fromText(i % 2 ? "skin" : "wave", "", i % 3 ? "a" : "b");
        std::shuffle(kernels.begin(), kernels.end(), random);
        for (const Kernel& kernel : kernels)
            ASSERT_TRUE(fStore->freeKernel(kernel));
        kernels.clear();
        ASSERT_EQ(runtime().balance(), before);
    }
}

TEST_F(KernelStoreTest, AStoreThatGoesLeavesHandedOutKernels)
{
    const Kernel kernel = fromText();
    fromText("wave");
    calls();
    fStore.reset();
    const Lines lines = calls();
    EXPECT_THAT(lines, ::testing::UnorderedElementsAre("clReleaseKernel(kernel#1)",
                                                       "clReleaseKernel(kernel#2)",
                                                       "clReleaseProgram(program#1)"));
    EXPECT_EQ(lines.back(), "clReleaseProgram(program#1)");
    EXPECT_EQ(runtime().references(Kind::kKernel, kernel.get()), 1U);
}

TEST_F(KernelStoreTest, AWrongKernelNameKeepsTheBuild)
{
    EXPECT_EQ(fromText("missing").get(), nullptr);
    EXPECT_EQ(warnings(), Lines{"OpenCL error: CL_INVALID_KERNEL_NAME"});
    EXPECT_TRUE(fStore->freeKernel(fromText("skin", "", "other"))); // takes its own program alone
    const Kernel kernel = fromText("skin");
    EXPECT_NE(kernel.get(), nullptr);
    EXPECT_EQ(builds(), 2U) << "this and the other";
    EXPECT_TRUE(fStore->freeKernel(kernel));
    EXPECT_EQ(calls(), (Lines{"clReleaseKernel(kernel#2)", "clReleaseProgram(program#1)"}))
        << "the wrong name left no kernel in the list";
}

TEST_F(KernelStoreTest, AHandleCountsWhateverTheStatus)
{
    for (const char* function : {"clCreateProgramWithSource", "clCreateKernel"}) {
        SCOPED_TRACE(function);
        runtime().plan({.function = function, .withHandle = true});
        EXPECT_NE(fromText("skin", "", function).get(), nullptr);
        EXPECT_EQ(warnings(), Lines{"OpenCL error: CL_OUT_OF_RESOURCES"});
        runtime().clearFaults();
        runtime().plan({.function = function, .status = CL_SUCCESS}); // and no handle
        EXPECT_EQ(fromText("skin", "", "nothing").get(), nullptr);
    }
}

TEST_F(KernelStoreTest, AFailedBuildIsReportedWithItsLogAndForgotten)
{
    runtime().plan({.function = "clReleaseProgram"}); // of which nobody hears
    for (int attempt = 0; attempt < 2; ++attempt) {
        EXPECT_EQ(fStore->getKernelFromString("#error", "bad", "", "skin", nullptr).get(), nullptr);
        EXPECT_EQ(warnings(), (Lines{"OpenCL error: CL_BUILD_PROGRAM_FAILURE", world.buildLog}));
        EXPECT_EQ(builds(), 1U);
    }
}

TEST_F(KernelStoreTest, ALogThatCannotBeReadIsNotQuoted)
{
    for (const unsigned query : {2U, 3U}) { // its size, its text
        runtime().clearFaults();
        runtime().plan({.function = "clGetProgramBuildInfo", .nth = query});
        fStore->getKernelFromString("#error", "bad", "", "skin", nullptr);
        EXPECT_EQ(warnings(), (Lines{"OpenCL error: CL_BUILD_PROGRAM_FAILURE",
                                     "OpenCL error: CL_OUT_OF_RESOURCES"}));
    }
}

// Some runtimes answer with an empty text, some with no text at all.
class SilentCompilerTest : public KernelStoreTest, public ::testing::WithParamInterface<bool> {
protected:
    void SetUp() override
    {
        world.buildLog = "";
        if (GetParam())
            world.emptyAnswers = {CL_PROGRAM_BUILD_LOG};
        KernelStoreTest::SetUp();
    }
};

TEST_P(SilentCompilerTest, IsNotQuoted)
{
    fStore->getKernelFromString("#error", "bad", "", "skin", nullptr);
    EXPECT_EQ(warnings(), Lines{"OpenCL error: CL_BUILD_PROGRAM_FAILURE"});
}
INSTANTIATE_TEST_SUITE_P(KernelStore, SilentCompilerTest, ::testing::Bool());

TEST_F(KernelStoreTest, ABuildThatOnlyReportsFailureCounts)
{
    runtime().plan({.function = "clGetProgramBuildInfo", .status = CL_INVALID_DEVICE});
    EXPECT_EQ(fromText().get(), nullptr);
    EXPECT_EQ(warnings().front(), "OpenCL error: CL_INVALID_DEVICE");
    // The build says no, the status says yes: the status decides.
    runtime().plan({.function = "clBuildProgram", .withHandle = true});
    EXPECT_NE(fromText().get(), nullptr);
    EXPECT_EQ(warnings(), Lines{"OpenCL error: CL_OUT_OF_RESOURCES"});
}

TEST_F(KernelStoreTest, BeforeInitializeThereIsNoKernel)
{
    fStore = std::make_unique<TopenCLKernelStore>();
    fStore->initialize(nullptr, TopenCLInfo::theOne().openCLDevice(), kNVIDIAProvider);
    EXPECT_EQ(fromText().get(), nullptr);
    EXPECT_EQ(warnings(), Lines{"OpenCL error: CL_INVALID_CONTEXT"});
    expectMisuse("clCreateProgramWithSource: null");
}

TEST_F(KernelStoreTest, InitializingWithoutAContextChangesNothing)
{
    fStore->initialize(nullptr, nullptr, kNVIDIAProvider);
    const Kernel kernel = fromText("skin", "-DA");
    EXPECT_EQ(callsOf("clBuildProgram"),
              Lines{"clBuildProgram(program#1, [device#1], \"-DA -D SupportsDoublePrecision\")"});
}

TEST_F(KernelStoreTest, TheVendorsOwnFlagIsNoPartOfTheKey)
{
    const TopenCLInfo& info = TopenCLInfo::theOne();
    const TstringArray folders = arrayOf({"a"});
    const Kernel kernel = fromText("skin", " -I a");
    fStore->initialize(info.openCLContext(), info.openCLDevice(), kNVIDIAProvider);
    fStore->getKernelFromString(kSource, "text", "", "skin", &folders); // in other words
    EXPECT_EQ(builds(), 1U);
}

TEST_F(KernelStoreTest, UnreadableFilesGiveNoKernelAndNoWord)
{
    const std::string directory = testing::TempDir();
    const std::string empty = file("");
    const char* withoutEnd = "/dev/ptmx"; // where there is one, it opens but tells no size
    for (const char* path : {"no/such/file.cl", empty.c_str(), directory.c_str(), withoutEnd})
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
    constexpr std::uintmax_t kTooLarge = std::uintmax_t{1} << 31; // a sparse file
    std::filesystem::resize_file(file("#"), kTooLarge);
    EXPECT_FALSE(TopenCLInfo::oclLoadProgSource(source, fFile.c_str(), "#"));
    EXPECT_EQ(source.length(), 0U);
    fStore->getKernel(file("skin"), "", "skin", nullptr);
    EXPECT_EQ(callsOf("clCreateProgram"),
              Lines{"clCreateProgramWithSource(context#1, 1, \"skin\", null) = program#1"});
}

TEST_F(KernelStoreTest, TheResourceDirectoryIsAskedForOnce)
{
    TopenCLInfo& info = TopenCLInfo::theOne();
    EXPECT_STREQ(info.getAbsolutePathToResources().asChar(), "scripted/resources");
    EXPECT_EQ(&info.getAbsolutePathToResources(), &info.getAbsolutePathToResources());
    EXPECT_EQ(calls(), Lines{"getResourcesLocation()"});
}

struct OptionsRow {
    const char* flags; // may be null
    std::vector<const char*> directories;
    bool doublePrecision;
    OpenCLProvider provider;
    std::string options;
};

TEST_F(KernelStoreTest, BuildOptionsReachTheCompilerToTheCharacter)
{
    const std::string standard = "-cl-fast-relaxed-math -cl-mad-enable -cl-no-signed-zeros -Werror";
    const OptionsRow rows[] = {
        {nullptr, {}, false, kIntelProvider, standard},
        {"", {}, false, kIntelProvider, ""},
        {"-DFOO", {"inc"}, false, kIntelProvider, "-DFOO -I inc"},
        {"", {" ab ", " a b "}, false, kIntelProvider, " -I ab -I \"a b\""},
        {"", {"\ta\tb\t"}, false, kIntelProvider, " -I \ta\tb\t"},
        {"", {"a \"b\"", "\"", "", "  "}, false, kIntelProvider, " -I \"a \"b\"\" -I \" -I  -I "},
        {"", {}, false, kNVIDIAProvider, " -cl-nv-verbose"},
        {"", {}, false, kAMDProvider, ""},
        {"", {}, false, kAppleProvider, ""},
        {"", {}, false, kUnknownProvider, ""},
        {nullptr,
         {"C:/res", " C:/My Res "},
         true,
         kNVIDIAProvider,
         standard + " -I C:/res -I \"C:/My Res\" -D SupportsDoublePrecision -cl-nv-verbose"}};
    for (const OptionsRow& row : rows) {
        TopenCLInfo::theOne().setAllowDoublePrecisionSupport(row.doublePrecision);
        makeStore(row.provider);
        const TstringArray directories = arrayOf(row.directories);
        fStore->getKernelFromString(kSource, "name", row.flags, "skin", &directories);
        EXPECT_THAT(callsOf("clBuildProgram"),
                    ::testing::ElementsAre(::testing::EndsWith(", \"" + row.options + "\")")));
    }
}

} // namespace
