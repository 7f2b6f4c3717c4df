// The kernel store: which programs are built and cached, which kernels are created and freed.
#include "ScriptedTest.h"
#include "host/TstringArray.h"
#include "kernels/TopenCLKernelStore.h"

#include <filesystem>
#include <fstream>
#include <memory>
#include <tuple>

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
        fStore = std::make_unique<TopenCLKernelStore>();
        fStore->initialize(context(), info().openCLDevice(), provider);
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
    // Writes a source file with this content, which the test removes at its end. Returns its path.
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

// A faulty runtime returns one handle twice, within one program or across two.
TEST_F(KernelStoreTest, KernelReturnedTwiceIsFreedTwice)
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
        EXPECT_EQ(builds(), 1U) << "the program was released with its last kernel";
        EXPECT_TRUE(fStore->freeKernel(third));
    }
}

TEST_F(KernelStoreTest, CacheKeyIsNameAndOptionsNotText)
{
    constexpr const char* kLong = "-DA -D THE_SAME_ENDING";
    // Directories are options, too.
    const std::tuple<const char*, const char*, std::vector<const char*>, std::size_t> rows[] = {
        {"name", "-DA", {}, 1},
        {"name", "-DB", {}, 1},
        {"name", "-DA", {"a"}, 1},
        {"name", "-DA", {"b"}, 1},
        {"name", "-DA", {"a", "b"}, 1},
        {"name", "-DA", {"b", "a"}, 1},
        {"name", "-DA", {"a", "c"}, 1},
        {"name", "-DA -I a", {}, 0}, // the same options
        {"name", "", {}, 1},
        {"name", nullptr, {}, 1},
        {"a/the-same-ending.cl", kLong, {}, 1},
        {"a/the-same-ending.cl", "-DB -D THE_SAME_ENDING", {}, 1},
        {"b/the-same-ending.cl", kLong, {}, 1}};
    for (const auto& [name, flags, list, expected] : rows) {
        const TstringArray directories = arrayOf(list);
        const auto kernel = fStore->getKernelFromString(kSource, name, flags, "skin", &directories);
        EXPECT_EQ(builds(), expected) << name << flags;
    }
    // A name that is cached is not looked up as a file.
    for (const auto& [name, flags, list, expected] : rows) {
        const TstringArray directories = arrayOf(list);
        EXPECT_NE(fStore->getKernel(name, flags, "wave", &directories).get(), nullptr) << name;
    }
    EXPECT_NE(fStore->getKernel("name", "-DA -I b", "wave", nullptr).get(), nullptr);
    EXPECT_EQ(builds(), 0U);
    // Without double precision the options differ, and so does the key.
    info().setAllowDoublePrecisionSupport(false);
    fromText("skin", "-DA", "name");
    EXPECT_EQ(callsOf("clBuildProgram"), Lines{"clBuildProgram(program#13, [device#1], \"-DA\")"});
}

TEST_F(KernelStoreTest, CacheHitCreatesKernelAndFreeingLastKernelDropsProgram)
{
    const TstringArray folders = arrayOf({"a"});
    const auto withFolder = [&](const char* kernel) {
        return fStore->getKernelFromString(kSource, "text", "", kernel, &folders);
    };
    const Kernel first = fromText("skin", " -I a");
    const Kernel second = withFolder("wave");
    EXPECT_EQ(
        calls(),
        (Lines{std::string("clCreateProgramWithSource(context#1, 1, \"") + kSource +
                   "\", null) = program#1",
               "clBuildProgram(program#1, [device#1], \" -I a -D SupportsDoublePrecision\")",
               "clGetProgramBuildInfo(program#1, device#1, 4481)",
               "clCreateKernel(program#1, \"skin\") = kernel#1", "clRetainKernel(kernel#1)",
               "clCreateKernel(program#1, \"wave\") = kernel#2", "clRetainKernel(kernel#2)"}));
    EXPECT_TRUE(fStore->freeKernel(first));
    EXPECT_FALSE(fStore->freeKernel(first));
    EXPECT_TRUE(fStore->freeKernel(Kernel()));
    EXPECT_TRUE(fStore->freeKernel(second));
    EXPECT_EQ(calls(), (Lines{"clReleaseKernel(kernel#1)", "clReleaseKernel(kernel#2)",
                              "clReleaseProgram(program#1)"}));
    // The program is dropped for every spelling of its options.
    for (const bool other : {true, false, true}) {
        const Kernel kernel = other ? withFolder("skin") : fromText("skin", " -I a");
        EXPECT_EQ(builds(), 1U);
        for (const Kernel& more : {withFolder("wave"), fromText("wave", " -I a"), kernel})
            EXPECT_TRUE(fStore->freeKernel(more));
    }
}

TEST_F(KernelStoreTest, DestructorReleasesProgramsLast)
{
    const Kernel kernel = fromText();
    calls();
    fStore.reset();
    EXPECT_EQ(calls(), (Lines{"clReleaseKernel(kernel#1)", "clReleaseProgram(program#1)"}));
    EXPECT_EQ(runtime().references(Kind::kKernel, kernel.get()), 1U);
}

TEST_F(KernelStoreTest, WrongKernelNameKeepsProgram)
{
    EXPECT_EQ(fromText("missing").get(), nullptr);
    EXPECT_EQ(warnings(), Lines{"OpenCL error: CL_INVALID_KERNEL_NAME"});
    EXPECT_TRUE(fStore->freeKernel(fromText("skin", "", "other"))); // releases its own program only
    const Kernel kernel = fromText("skin");
    EXPECT_NE(kernel.get(), nullptr);
    EXPECT_EQ(builds(), 2U) << "this and the other";
    EXPECT_TRUE(fStore->freeKernel(kernel));
    EXPECT_EQ(calls(), (Lines{"clReleaseKernel(kernel#2)", "clReleaseProgram(program#1)"}))
        << "the wrong name left no kernel in the list";
}

TEST_F(KernelStoreTest, HandleIsUsedWhateverTheStatus)
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

struct LogRow : Named {
    const char* log;
    bool unanswered = false; // not even an empty text
};
class FailedBuild : public KernelStoreTest, public ::testing::WithParamInterface<LogRow> {
protected:
    void SetUp() override
    {
        machine.buildLog = GetParam().log;
        if (GetParam().unanswered)
            machine.emptyAnswers = {CL_PROGRAM_BUILD_LOG};
        KernelStoreTest::SetUp();
    }
};

TEST_P(FailedBuild, IsReportedWithLogAndNotCached)
{
    runtime().plan({.function = "clReleaseProgram"}); // not reported
    for (const unsigned fails : {2U, 3U, 0U}) { // the query that fails: size or text of the log
        if (fails > 0 && !*GetParam().log)
            continue;
        runtime().plan({.function = "clGetProgramBuildInfo", .nth = fails});
        EXPECT_EQ(fStore->getKernelFromString("#error", "bad", "", "skin", nullptr).get(), nullptr);
        Lines expected{"OpenCL error: CL_BUILD_PROGRAM_FAILURE"};
        if (fails > 0)
            expected.push_back("OpenCL error: CL_OUT_OF_RESOURCES");
        else if (*GetParam().log)
            expected.push_back(GetParam().log);
        EXPECT_EQ(warnings(), expected);
        EXPECT_EQ(builds(), 1U);
    }
}
INSTANTIATE_TEST_SUITE_P(KernelStore, FailedBuild,
                         ::testing::Values(LogRow{"Log", "line 1: 100%s wrong"},
                                           LogRow{"EmptyLog", ""}, LogRow{"NoLog", "", true}),
                         ::testing::PrintToStringParamName());

TEST_F(KernelStoreTest, BuildWithFailedStatusIsFailure)
{
    runtime().plan({.function = "clGetProgramBuildInfo", .status = CL_INVALID_DEVICE});
    EXPECT_EQ(fromText().get(), nullptr);
    EXPECT_EQ(warnings().front(), "OpenCL error: CL_INVALID_DEVICE");
    // If clBuildProgram fails and the build status is success, the build status decides.
    runtime().plan({.function = "clBuildProgram", .withHandle = true});
    EXPECT_NE(fromText().get(), nullptr);
    EXPECT_EQ(warnings(), Lines{"OpenCL error: CL_OUT_OF_RESOURCES"});
}

TEST_F(KernelStoreTest, InitializeWithoutContextChangesNothing)
{
    const cl_device_id device = info().openCLDevice();
    fStore->initialize(nullptr, nullptr, kNVIDIAProvider);
    fromText("skin", "-DA");
    EXPECT_EQ(callsOf("clBuildProgram"),
              Lines{"clBuildProgram(program#1, [device#1], \"-DA -D SupportsDoublePrecision\")"});
    fStore = std::make_unique<TopenCLKernelStore>();
    fStore->initialize(nullptr, device, kNVIDIAProvider);
    EXPECT_EQ(fromText().get(), nullptr);
    EXPECT_EQ(warnings(), Lines{"OpenCL error: CL_INVALID_CONTEXT"});
    expectMisuse("clCreateProgramWithSource: null");
}

TEST_F(KernelStoreTest, CacheKeyOmitsVendorFlag)
{
    const TstringArray folders = arrayOf({"a"});
    fromText("skin", " -I a");
    fStore->initialize(context(), info().openCLDevice(), kNVIDIAProvider);
    const auto kernel =
        fStore->getKernelFromString(kSource, "text", "", "skin", &folders); // the same options
    EXPECT_EQ(builds(), 1U);
}

TEST_F(KernelStoreTest, UnreadableSourceReturnsEmptyKernelSilently)
{
    const std::string directory = testing::TempDir();
    const std::string empty = file("");
    const char* withoutEnd = "/dev/ptmx"; // if it exists, it opens but has no size
    for (const char* path : {"no/such/file.cl", empty.c_str(), directory.c_str(), withoutEnd})
        EXPECT_EQ(fStore->getKernel(path, "", "skin", nullptr).get(), nullptr) << path;
    EXPECT_EQ(calls(), Lines{});
    file("skin"); // now it is readable
    EXPECT_NE(fStore->getKernel(empty.c_str(), "", "skin", nullptr).get(), nullptr);
    EXPECT_EQ(callsOf("clCreateProgram"),
              Lines{"clCreateProgramWithSource(context#1, 1, \"skin\", null) = program#1"});
}

TEST_F(KernelStoreTest, SourceIsReadUnchangedAfterPreamble)
{
    Tstring source("before");
    ASSERT_TRUE(TopenCLInfo::oclLoadProgSource(source, file("a\r\nb\n\x1A"), "#"));
    EXPECT_EQ(std::string(source.asChar(), source.length()), "#a\r\nb\n\x1A");
    constexpr std::uintmax_t kTooLarge = std::uintmax_t{1} << 31; // a sparse file
    std::filesystem::resize_file(fFile, kTooLarge);
    for (const char* path : {fFile.c_str(), "no/such/file.cl"}) {
        EXPECT_FALSE(TopenCLInfo::oclLoadProgSource(source, path, "#"));
        EXPECT_EQ(source.length(), 0U);
        source = Tstring("before");
    }
}

TEST_F(KernelStoreTest, ResourceDirectoryIsQueriedOnce)
{
    EXPECT_STREQ(info().getAbsolutePathToResources().asChar(), "scripted/resources");
    EXPECT_EQ(&info().getAbsolutePathToResources(), &info().getAbsolutePathToResources());
    EXPECT_EQ(calls(), Lines{"getResourcesLocation()"});
}

TEST_F(KernelStoreTest, BuildOptionsArePassedExactly)
{
    const std::string standard = "-cl-fast-relaxed-math -cl-mad-enable -cl-no-signed-zeros -Werror";
    const std::tuple<OpenCLProvider, const char*, std::vector<const char*>, std::string> rows[] = {
        {kIntelProvider, nullptr, {}, standard},
        {kIntelProvider, "-DFOO", {"inc"}, "-DFOO -I inc"},
        {kIntelProvider, "", {" ab ", " a b "}, " -I ab -I \"a b\""},
        {kIntelProvider, "", {"\ta\tb\t"}, " -I \ta\tb\t"},
        {kIntelProvider, "", {"a \"b\"", "\"", "", "  "}, " -I \"a \"b\"\" -I \" -I  -I "},
        {kNVIDIAProvider, nullptr, {" C:/My Res "}, standard + " -I \"C:/My Res\""},
        {kAMDProvider, "", {}, ""},
        {kAppleProvider, "", {}, ""},
        {kUnknownProvider, "", {}, ""}};
    for (const auto& [provider, flags, list, options] : rows) {
        for (const bool doublePrecision : {true, false}) {
            info().setAllowDoublePrecisionSupport(doublePrecision);
            makeStore(provider);
            const TstringArray directories = arrayOf(list);
            const auto kernel =
                fStore->getKernelFromString(kSource, "name", flags, "skin", &directories);
            EXPECT_THAT(
                callsOf("clBuildProgram"),
                ::testing::ElementsAre(::testing::EndsWith(
                    ", \"" + options + (doublePrecision ? " -D SupportsDoublePrecision" : "") +
                    (provider == kNVIDIAProvider ? " -cl-nv-verbose" : "") + "\")")));
        }
    }
}

} // namespace
