// Start-up as far as the platform: loading, vendors, the listing and its failures.
#include "PrivateMember.h"
#include "StartUpCase.h"
#include "kernels/TopenCLKernelStore.h"

using namespace scripted;

struct CleanUp : PrivateMember<void (TopenCLInfo::*)()> {
    friend Type memberOf(CleanUp);
};
struct FindPlatform : PrivateMember<bool (*)(const Tstring&, cl_platform_id&, Tstring&)> {
    friend Type memberOf(FindPlatform);
};
template struct Reveal<CleanUp, &TopenCLInfo::cleanUpOpenCL>;
template struct Reveal<FindPlatform, &TopenCLInfo::findPlatformByVendor>;

namespace {

const std::string kNotFound =
    "OpenCL evaluator failed to find OpenCL device with vendor " + kIntel + ".\n";
const std::string kIntelLine =
    " 0: Intel(R) Corporation. Scripted platform. OpenCL 1.2 scripted.\n";
const PlatformScript kSomebody{.vendor = "Somebody", .devices = {}};

// Rows are kept on one line.
// clang-format off
const StartUpRow kPlatformRows[] = {
    {"ByTheBook", [](StartUp& c) {
         c.error = "OpenCL evaluator is attempting to initialize OpenCL.\n"
                   "Detected 1 OpenCL Platforms: \n"
                   " 0: Intel(R) Corporation. Scripted platform. OpenCL 1.2 scripted.\n"
                   " Supported extensions: cl_khr_gl_sharing cl_khr_gl_event \n"
                   " Selected matching OpenCL Platform: Intel(R) Corporation Scripted platform OpenCL 1.2 scripted.\n"
                   "OpenCL evaluator choosing OpenCL platform Intel(R) Corporation.\n"
                   "Choosing OpenCL Device Scripted GPU.  Device Type: GPU  Device is available.\n\n"; }},
#if !defined(_WIN32) // a variable cannot be empty there
    {"DisabledByAnEmptyVariable", [](StartUp& c) {
         c.environment = {{"VYRA_DISABLE_OPENCL", ""}};
         c.stopsBeforePlatform("OpenCL initialization has been disabled by user\n"); }},
    {"EmptyVendorName", [](StartUp& c) {
         c.environment = {{"VYRA_OPENCL_PLATFORM", ""}};
         c.stopsBeforePlatform(listing(c.machine, kNoPlatform) + "OpenCL evaluator failed to find OpenCL device with vendor .\n"); }},
    {"DriverIgnoredByAnEmptyVariable", [](StartUp& c) {
         c.onNVIDIA("365.10");
         c.environment = {{"VYRA_OPENCL_IGNORE_DRIVER_VERSION", ""}};
         c.modes = {1, 2}; }},
    {"ThreadingForcedByAnEmptyVariable", [](StartUp& c) {
         c.onNVIDIA("400.00");
         c.environment = {{"VYRA_OPENCL_FORCE_THREADING", ""}};
         c.error = "Deformer evaluator detected VYRA_OPENCL_FORCE_THREADING is set\n" + c.wholeText();
         c.threadedSharing = true; }},
#endif
    {"LoadingThrowsAnException", [](StartUp& c) {
         c.machine.lookUp = LookUp::kThrowsStandardException;
         c.stopsBeforePlatform("CLEW failed to initialize: scripted look-up  Vyra running without OpenCL support.\n"); }},
    {"LoadingThrowsSomethingElse", [](StartUp& c) {
         c.machine.lookUp = LookUp::kThrowsNumber;
         c.arguments.vendorId = 1; // read only later
         c.stopsBeforePlatform("CLEW failed to initialize.  Vyra running without OpenCL support.\n"); }},
    {"UnknownVendorId", [](StartUp& c) {
         c.arguments.vendorId = 0x1AB8;
         c.stopsBeforePlatform("OpenCL evaluator encountered an unknown vendor id 1ab8 while trying to initialize OpenCL.\n"); }},
    {"NoPlatforms", [](StartUp& c) { c.machine.platforms.clear(); c.stopsBeforePlatform(kNotFound); }},
    {"CountingPlatformsFails", [](StartUp& c) { c.fails("clGetPlatformIDs", 1); c.warnings = {}; c.stopsBeforePlatform(kNotFound); }},
    {"ReadingPlatformIdsFails", [](StartUp& c) { c.fails("clGetPlatformIDs", 2); c.stopsBeforePlatform(kNotFound); }},
    {"VendorsAreWholeNames", [](StartUp& c) {
         c.platform().vendor = "Intel(R) Corporation and others";
         c.machine.platforms.push_back({.vendor = "Intel(R)"});
         c.machine.platforms.push_back({.vendor = "intel(r) corporation"});
         c.stopsBeforePlatform(listing(c.machine, kNoPlatform) + kNotFound); }},
    {"QueryFailsBeforeTheMatch", [](StartUp& c) {
         c.machine.platforms.insert(c.machine.platforms.begin(), kSomebody);
         c.fails("clGetPlatformInfo", 1);
         c.stopsBeforePlatform("Detected 2 OpenCL Platforms: \n" + kNotFound); }},
    {"PlatformNameFails", [](StartUp& c) { c.fails("clGetPlatformInfo", 3); c.stopsBeforePlatform("Detected 1 OpenCL Platforms: \n" + kNotFound); }},
    {"PlatformVersionFails", [](StartUp& c) { c.fails("clGetPlatformInfo", 6); c.stopsBeforePlatform("Detected 1 OpenCL Platforms: \n" + kNotFound); }},
    {"ExtensionsFailBeforeTheMatch", [](StartUp& c) {
         c.fails("clGetPlatformInfo", 8); // the value of the fourth text
         c.stopsBeforePlatform("Detected 1 OpenCL Platforms: \n" + kIntelLine + kNotFound); }},
    {"QueryFailsAfterTheMatch", [](StartUp& c) {
         const std::string whole = c.wholeText();
         c.error = std::string(whole).replace(whole.find("Detected 1"), 10, "Detected 2");
         c.machine.platforms.push_back(kSomebody);
         c.fails("clGetPlatformInfo", 9); }},
    {"FirstOfTwoPlatformsOfTheVendor", [](StartUp& c) {
         c.machine.platforms.insert(c.machine.platforms.begin(), kSomebody);
         c.machine.platforms.push_back({.extensions = "none"}); }},
    {"AMDById", [](StartUp& c) { c.onVendor("Advanced Micro Devices, Inc.", kAMDProvider, 0x1002); }},
    {"AMDByDecimalId", [](StartUp& c) { c.onVendor("Advanced Micro Devices, Inc.", kAMDProvider, 0x3EA); }},
    {"AppleByNameWhateverTheId", [](StartUp& c) {
         c.environment = {{"VYRA_OPENCL_PLATFORM", "Apple"}};
         c.onVendor("Apple", kAppleProvider, 0x8086); }},
    {"AnyOtherByName", [](StartUp& c) {
         c.environment = {{"VYRA_OPENCL_PLATFORM", "apple"}};
         c.onVendor("apple", kUnknownProvider, 1); }},
    {"MinimumFromTheEnvironmentOnNVIDIA", [](StartUp& c) {
         c.onNVIDIA("385.31");
         c.environment = {{"VYRA_OPENCL_DEFORMER_MIN_VERTS", "12x"}};
         c.minimumBufferSize = 12;
         c.error = c.platformText() + "OpenCL evaluator detected VYRA_OPENCL_DEFORMER_MIN_VERTS defined to 12.\n" + kReported + "\n"; }},
};
// clang-format on
INSTANTIATE_TEST_SUITE_P(Platform, StartUpRows, ::testing::ValuesIn(kPlatformRows), kName);

using StartUpOnce = ScriptedTest;

class StartUpAgain : public ScriptedTest, public ::testing::WithParamInterface<bool> {};

TEST_P(StartUpAgain, InitializeAgainChangesAndPrintsNothing)
{
    const bool disabled = GetParam();
    if (disabled)
        setEnvironment("VYRA_DISABLE_OPENCL", "0");
    EXPECT_EQ(startWatched(), !disabled);
    EXPECT_EQ(callsOf("cl").empty(), disabled);
    setEnvironment("VYRA_DISABLE_OPENCL", nullptr);
    testing::internal::CaptureStderr();
    EXPECT_EQ(TopenCLInfo::initialize(nullptr, nullptr, nullptr, true, false, 0x8086), !disabled);
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
    EXPECT_EQ(calls(), Lines{});
    EXPECT_FALSE(info().usingDX());
}
INSTANTIATE_TEST_SUITE_P(StartUp, StartUpAgain, ::testing::Bool());

TEST_F(StartUpOnce, OnlyExtensionFunctionsAreLookedUpThroughRuntime)
{
    ASSERT_TRUE(startWatched());
    const Lines lookUps = callsOf("clGetExtensionFunctionAddress");
    EXPECT_EQ(lookUps.size(), 12U);
    EXPECT_THAT(lookUps, ::testing::Each(::testing::AnyOf(::testing::HasSubstr("GL"),
                                                          ::testing::HasSubstr("D3D11"))));
}

TEST_F(StartUpOnce, OptionSettersReturnWhetherValueChanged)
{
    machine.platforms[0].devices[0].doublePrecision = 0;
    ASSERT_TRUE(start());

    EXPECT_FALSE(info().setMinimumBufferSize(-1)); // it is the default already
    EXPECT_TRUE(info().setMinimumBufferSize(7));
    EXPECT_EQ(info().minimumBufferSize(), 7);
    EXPECT_TRUE(info().setUseMinimumBufferSize(false));
    EXPECT_FALSE(info().setUseMinimumBufferSize(false));
    EXPECT_EQ(info().minimumBufferSize(), 0);
    EXPECT_TRUE(info().setUseMinimumBufferSize(true));
    EXPECT_EQ(info().minimumBufferSize(), 7);

    setEnvironment("VYRA_OPENCL_DEFORMER_MIN_VERTS", "-5");
    testing::internal::CaptureStderr();
    EXPECT_TRUE(info().setMinimumBufferSize(-1));
    EXPECT_FALSE(info().setMinimumBufferSize(-1));
    EXPECT_FALSE(info().setMinimumBufferSize(0)) << "0 does not select the default";
    const std::string line =
        "OpenCL evaluator detected VYRA_OPENCL_DEFORMER_MIN_VERTS defined to 0.\n";
    EXPECT_EQ(testing::internal::GetCapturedStderr(), line + line);

    EXPECT_TRUE(info().usingGPU());
    EXPECT_FALSE(info().usingOutOfOrderExecution());
    EXPECT_TRUE(info().setAllowDoublePrecisionSupport(true)); // becomes false: no double precision
    EXPECT_FALSE(info().allowDoublePrecisionSupport());
    EXPECT_FALSE(info().setAllowDoublePrecisionSupport(true));
}

TEST_F(StartedTest, CleanUpReleasesKernelStoreOnly)
{
    const auto kernel =
        info().kernelStore().getKernelFromString("skin", "program", "", "skin", nullptr);
    calls();
    (info().*memberOf(CleanUp()))();
    (info().*memberOf(CleanUp()))();
    EXPECT_EQ(calls(), (Lines{"clReleaseKernel(kernel#1)", "clReleaseProgram(program#1)"}));
    EXPECT_EQ(context(), nullptr);
    EXPECT_EQ(info().openCLCommandQueue(), nullptr);
    EXPECT_EQ(info().secondaryOpenCLCommandQueue(), nullptr);
    EXPECT_EQ(runtime().name(info().openCLDevice()), "device#1");
}

TEST_F(StartUpOnce, PlatformsAreListedUntilOneListIsComplete)
{
    faults = {{.function = "clGetPlatformInfo"}};
    EXPECT_FALSE(start());
    EXPECT_EQ(warnings(), Lines{kOutOfResources});
    for (const std::string& expected : {listing(machine, 0), std::string()}) {
        cl_platform_id platform = nullptr;
        Tstring extensions;
        testing::internal::CaptureStderr();
        EXPECT_TRUE(memberOf(FindPlatform())(kIntel.c_str(), platform, extensions));
        EXPECT_EQ(testing::internal::GetCapturedStderr(), expected);
    }
}

TEST_F(StartedTest, ContextErrorsAreWrittenToStandardError)
{
    testing::internal::CaptureStderr();
    runtime().raiseContextError("the device is lost");
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "OpenCL Error: the device is lost\n");
}

} // namespace
