// Start-up as far as the platform: loading, vendors, the listing and its failures.
#include "StartUpCase.h"

using namespace scripted;

namespace {

const std::string kIntel = "Intel(R) Corporation";
const std::string kNotFound =
    "OpenCL evaluator failed to find OpenCL device with vendor " + kIntel + ".\n";

// A start-up without incident on a platform of that vendor.
void succeedsOn(StartUp& c, const char* vendor, OpenCLProvider provider, bool asyncReadback)
{
    c.world.platforms[0].vendor = vendor;
    c.error = c.platformText(vendor) + c.deviceText();
    c.provider = provider;
    c.asyncReadback = asyncReadback;
}

const StartUpRow kPlatformRows[] = {
    {"ByTheBook",
     [](StartUp& c) {
         c.error = "OpenCL evaluator is attempting to initialize OpenCL.\n"
                   "Detected 1 OpenCL Platforms: \n"
                   " 0: Intel(R) Corporation. Scripted platform. OpenCL 1.2 scripted.\n"
                   " Supported extensions: cl_khr_gl_sharing cl_khr_gl_event \n"
                   " Selected matching OpenCL Platform: Intel(R) Corporation Scripted platform "
                   "OpenCL 1.2 scripted.\n"
                   "OpenCL evaluator choosing OpenCL platform Intel(R) Corporation.\n"
                   "Choosing OpenCL Device Scripted GPU.  Device Type: GPU  Device is available.\n"
                   "\n";
     }},
    {"DisabledByTheUser",
     [](StartUp& c) {
         c.environment = {{"VYRA_DISABLE_OPENCL", "0"}};
         c.stopsBeforePlatform("OpenCL initialization has been disabled by user\n");
     }},
    {"ForcedThreadingIsAnnouncedFirst",
     [](StartUp& c) {
         c.environment = {{"VYRA_OPENCL_FORCE_THREADING", "0"}};
         c.error = "Deformer evaluator detected VYRA_OPENCL_FORCE_THREADING is set\n" +
                   c.platformText(kIntel) + c.deviceText();
     }},
    {"LoadingThrowsAnException",
     [](StartUp& c) {
         c.world.lookUp = LookUp::kThrowsStandardException;
         c.stopsBeforePlatform("CLEW failed to initialize: scripted look-up  Vyra running without "
                               "OpenCL support.\n");
     }},
    {"LoadingThrowsSomethingElse",
     [](StartUp& c) {
         c.world.lookUp = LookUp::kThrowsNumber;
         c.stopsBeforePlatform(
             "CLEW failed to initialize.  Vyra running without OpenCL support.\n");
     }},
    {"UnknownVendorId",
     [](StartUp& c) {
         c.arguments.vendorId = 0x1AB8;
         c.stopsBeforePlatform(
             "OpenCL evaluator encountered an unknown vendor id 1ab8 while trying "
             "to initialize OpenCL.\n");
     }},
    {"NoPlatforms",
     [](StartUp& c) {
         c.world.platforms.clear();
         c.world.glDevices.clear();
         c.world.currentGLDevice.reset();
         c.stopsBeforePlatform(kNotFound);
     }},
    {"CountingPlatformsFails",
     [](StartUp& c) {
         c.fails("clGetPlatformIDs", 1);
         c.warnings = {};
         c.stopsBeforePlatform(kNotFound);
     }},
    {"ReadingPlatformIdsFails",
     [](StartUp& c) {
         c.fails("clGetPlatformIDs", 2);
         c.stopsBeforePlatform(kNotFound);
     }},
    {"NoPlatformOfTheVendor",
     [](StartUp& c) {
         c.world.platforms[0].vendor = "intel(r) corporation";
         c.stopsBeforePlatform(listing(c.world, kNoPlatform) + kNotFound);
     }},
    {"QueryFailsBeforeTheMatch",
     [](StartUp& c) {
         c.world.platforms.insert(c.world.platforms.begin(), {.vendor = "Somebody"});
         c.fails("clGetPlatformInfo", 1);
         c.stopsBeforePlatform("Detected 2 OpenCL Platforms: \n" + kNotFound);
     }},
    {"ExtensionsFailBeforeTheMatch",
     [](StartUp& c) {
         c.fails("clGetPlatformInfo", 8); // the value of the fourth text
         c.stopsBeforePlatform(
             "Detected 1 OpenCL Platforms: \n"
             " 0: Intel(R) Corporation. Scripted platform. OpenCL 1.2 scripted.\n" +
             kNotFound);
     }},
    {"QueryFailsAfterTheMatch",
     [](StartUp& c) {
         const std::string listed = listing(c.world, 0).substr(std::string("Detected 1").size());
         c.world.platforms.push_back({.vendor = "Somebody"});
         c.fails("clGetPlatformInfo", 9);
         c.error = kAttempt + "Detected 2" + listed +
                   "OpenCL evaluator choosing OpenCL platform Intel(R) Corporation.\n" +
                   c.deviceText();
     }},
    {"FirstOfTwoPlatformsOfTheVendor",
     [](StartUp& c) {
         c.world.platforms.push_back({.extensions = "none"});
         c.world.platforms.insert(c.world.platforms.begin(), {.vendor = "Somebody"});
         c.world.glDevices = {1};
         c.world.currentGLDevice = 1;
         c.device = "device#2";
         c.error = c.platformText(kIntel) + c.deviceText();
     }},
    {"AMDById",
     [](StartUp& c) {
         c.arguments.vendorId = 0x1002;
         succeedsOn(c, "Advanced Micro Devices, Inc.", kAMDProvider, true);
     }},
    {"AMDByDecimalId",
     [](StartUp& c) {
         c.arguments.vendorId = 0x3EA;
         succeedsOn(c, "Advanced Micro Devices, Inc.", kAMDProvider, true);
     }},
    {"NVIDIAById",
     [](StartUp& c) {
         c.arguments.vendorId = 0x10DE;
         c.world.platforms[0].devices[0].driverVersion = "385.31";
         succeedsOn(c, "NVIDIA Corporation", kNVIDIAProvider, true);
         c.minimumBufferSize = 2000;
     }},
    {"AppleByNameWhateverTheId",
     [](StartUp& c) {
         c.environment = {{"VYRA_OPENCL_PLATFORM", "Apple"}};
         succeedsOn(c, "Apple", kAppleProvider, false);
     }},
    {"AnyOtherByName",
     [](StartUp& c) {
         c.arguments.vendorId = 1;
         c.environment = {{"VYRA_OPENCL_PLATFORM", "apple"}};
         succeedsOn(c, "apple", kUnknownProvider, false);
     }},
    {"MinimumFromTheEnvironment",
     [](StartUp& c) {
         c.environment = {{"VYRA_OPENCL_DEFORMER_MIN_VERTS", "-5"}};
         c.minimumBufferSize = 0;
         c.error = c.platformText(kIntel) +
                   "OpenCL evaluator detected VYRA_OPENCL_DEFORMER_MIN_VERTS defined to 0.\n" +
                   c.deviceText();
     }},
};

class PlatformStartUp : public StartUpTest, public ::testing::WithParamInterface<StartUpRow> {};

TEST_P(PlatformStartUp, PrintsAnswersAndLeaves)
{
    StartUp expected;
    expected.error = expected.platformText(kIntel) + expected.deviceText();
    GetParam().set(expected);
    run(expected);
}
INSTANTIATE_TEST_SUITE_P(StartUp, PlatformStartUp, ::testing::ValuesIn(kPlatformRows), rowName);

using StartUpOnce = ScriptedTest;

TEST_F(StartUpOnce, ASecondInitializeChangesAndPrintsNothing)
{
    ASSERT_TRUE(start());
    testing::internal::CaptureStderr();
    EXPECT_TRUE(TopenCLInfo::initialize(nullptr, nullptr, nullptr, true, false, 0));
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
    EXPECT_EQ(calls(), Lines{});
    EXPECT_FALSE(TopenCLInfo::theOne().usingDX());
}

TEST_F(StartUpOnce, OptionsReportWhetherTheyChanged)
{
    world.platforms[0].devices[0].doublePrecision = 0;
    ASSERT_TRUE(start());
    TopenCLInfo& info = TopenCLInfo::theOne();

    EXPECT_FALSE(info.setMinimumBufferSize(-1)); // it is the default already
    EXPECT_TRUE(info.setMinimumBufferSize(7));
    EXPECT_EQ(info.minimumBufferSize(), 7);
    EXPECT_TRUE(info.setUseMinimumBufferSize(false));
    EXPECT_FALSE(info.setUseMinimumBufferSize(false));
    EXPECT_EQ(info.minimumBufferSize(), 0);

    setEnvironment("VYRA_OPENCL_DEFORMER_MIN_VERTS", "many");
    testing::internal::CaptureStderr();
    EXPECT_TRUE(info.setMinimumBufferSize(-1));
    EXPECT_FALSE(info.setMinimumBufferSize(-1));
    const std::string line =
        "OpenCL evaluator detected VYRA_OPENCL_DEFORMER_MIN_VERTS defined to 0.\n";
    EXPECT_EQ(testing::internal::GetCapturedStderr(), line + line);

    EXPECT_TRUE(info.setAllowDoublePrecisionSupport(true)); // becomes false: no double precision
    EXPECT_FALSE(info.allowDoublePrecisionSupport());
    EXPECT_FALSE(info.setAllowDoublePrecisionSupport(true));
}

TEST_F(StartUpOnce, ErrorsOfTheContextGoToStandardError)
{
    ASSERT_TRUE(start());
    testing::internal::CaptureStderr();
    runtime().raiseContextError("the device is lost");
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "OpenCL Error: the device is lost\n");
}

} // namespace
