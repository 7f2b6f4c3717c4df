// Start-up from the device to the kernel store: devices that share, context, report, precision,
// queues, compute units.
#include "StartUpCase.h"

using namespace scripted;

namespace {

const std::string kNoGPU =
    "OpenCL evaluator is unable to find a GPU device that can share VBOs with OpenGL.\n";
const std::string kNoGLFunctions =
    "Error: found cl_khr_gl_sharing but failed to get function pointers";
const std::string kNoDouble =
    "Vyra OpenCL is not supported on device because double precision is not supported.\n";
const std::string kDriverRange =
    "\nOpenCL is not supported by NVidia drivers between version 361.91 and 368.86.  To enabled "
    "OpenCL for this driver version set VYRA_OPENCL_IGNORE_DRIVER_VERSION=1.\n";

// Three devices that share with OpenGL; the driving one is left to the row.
void threeDevices(StartUp& c, cl_device_type first, cl_device_type second, cl_device_type third)
{
    c.world.platforms[0].devices = {{.type = first}, {.type = second}, {.type = third}};
    c.world.glDevices = {0, 1, 2};
}

void missesGL(StartUp& c, const char* function)
{
    c.world.missing = {function};
    c.stopsWithContext(kNoGLFunctions);
}

// A failing query of the device report, which stops after `printed`.
void reportStops(StartUp& c, unsigned nthDeviceQuery, const std::string& printed)
{
    c.fails("clGetDeviceInfo", nthDeviceQuery);
    c.stopsWithContext(printed);
}

void onNVIDIA(StartUp& c, const char* driver)
{
    c.arguments.vendorId = 0x10DE;
    c.world.platforms[0].vendor = "NVIDIA Corporation";
    c.world.platforms[0].devices[0].driverVersion = driver;
    c.error = c.platformText("NVIDIA Corporation") + c.deviceText();
}

// The creations of the primary queue fail with these statuses, the last attempt's one stays.
void primaryQueueFails(StartUp& c, cl_int status, unsigned attempts, const char* name)
{
    for (unsigned nth = 1; nth <= attempts; ++nth)
        c.faults.push_back({.function = "clCreateCommandQueue", .status = status, .nth = nth});
    c.warnings = {std::string("OpenCL error: ") + name + "\n"};
    c.valid = false;
    c.left = {"context#1 x1", "queue#1 x1"};
}

const StartUpRow kDeviceRows[] = {
    {"CurrentDeviceOfTheList",
     [](StartUp& c) {
         threeDevices(c, 4, 4, 4);
         c.world.currentGLDevice = 1;
         c.device = "device#2";
     }},
    {"CurrentDeviceOutsideTheList",
     [](StartUp& c) {
         threeDevices(c, 2, 4, 4);
         c.world.glDevices = {0, 1};
         c.world.currentGLDevice = 2;
         c.device = "device#2";
     }},
    {"NoCurrentDevice",
     [](StartUp& c) {
         threeDevices(c, 2, 8, 4);
         c.world.currentGLDevice.reset();
         c.device = "device#3";
     }},
    {"CurrentDeviceNoGPU",
     [](StartUp& c) {
         threeDevices(c, 2, 4, 4);
         c.device = "device#2";
     }},
    {"DefaultGPUIsNoGPU",
     [](StartUp& c) {
         threeDevices(c, 5, 2, 5);
         c.stopsBeforeDevice(kNoGPU);
     }},
    {"NoDeviceShares",
     [](StartUp& c) {
         c.world.glDevices.clear();
         c.stopsBeforeDevice(kNoGPU);
     }},
    {"UnwrittenDeviceTypeIsNoGPU",
     [](StartUp& c) {
         c.world.emptyAnswers = {CL_DEVICE_TYPE};
         c.stopsBeforeDevice(kNoGPU);
     }},
    {"UnwrittenDevicesAreNone",
     [](StartUp& c) {
         c.world.emptyAnswers = {0x2007, 0x2006};
         c.stopsBeforeDevice(kNoGPU);
     }},
    {"GLContextQueryMissing",
     [](StartUp& c) {
         c.world.missing = {"clGetGLContextInfoKHR"};
         c.stopsBeforeDevice(kNoGPU);
     }},
    {"GLDevicesFail",
     [](StartUp& c) {
         c.fails("clGetGLContextInfoKHR", 1);
         c.stopsBeforeDevice("");
     }},
    {"CurrentGLDeviceFails",
     [](StartUp& c) {
         c.fails("clGetGLContextInfoKHR", 2);
         c.stopsBeforeDevice("");
     }},
    {"TypeOfCurrentDeviceFails",
     [](StartUp& c) {
         c.fails("clGetDeviceInfo", 1);
         c.stopsBeforeDevice("");
     }},
    {"TypeOfListedDeviceFails",
     [](StartUp& c) {
         c.world.currentGLDevice.reset();
         c.fails("clGetDeviceInfo", 1);
         c.stopsBeforeDevice("");
     }},
    {"ContextFails",
     [](StartUp& c) {
         c.fails("clCreateContext");
         c.stopsWithContext("");
         c.modes = {3, 4};
         c.left = {};
     }},
    {"CreateFromGLMissing", [](StartUp& c) { missesGL(c, "clCreateFromGLBuffer"); }},
    {"AcquireGLMissing", [](StartUp& c) { missesGL(c, "clEnqueueAcquireGLObjects"); }},
    {"ReleaseGLMissing", [](StartUp& c) { missesGL(c, "clEnqueueReleaseGLObjects"); }},
    {"DeviceNameFails", [](StartUp& c) { reportStops(c, 2, ""); }},
    {"DeviceTypeFails",
     [](StartUp& c) { reportStops(c, 3, "Choosing OpenCL Device Scripted GPU.  "); }},
    {"AvailabilityFails",
     [](StartUp& c) {
         reportStops(c, 4, "Choosing OpenCL Device Scripted GPU.  Device Type: GPU  ");
     }},
    {"DeviceUnavailable",
     [](StartUp& c) {
         c.world.platforms[0].devices[0].available = false;
         c.stopsWithContext("Choosing OpenCL Device Scripted GPU.  Device Type: GPU  GL shared "
                            "device is not available, no OpenCL will be used\n");
     }},
    {"PlatformVersionFails",
     [](StartUp& c) {
         c.fails("clGetPlatformInfo", 9);
         c.stopsWithContext(
             "Choosing OpenCL Device Scripted GPU.  Device Type: GPU  Device is available.\n");
     }},
    {"DoublePrecisionFails",
     [](StartUp& c) {
         c.fails("clGetDeviceInfo", 5);
         c.stopsWithContext(
             "Choosing OpenCL Device Scripted GPU.  Device Type: GPU  Device is available.\n");
     }},
    {"DoubleByExtensionOn11",
     [](StartUp& c) {
         c.world.platforms[0].version = "OpenCL 1.1 scripted";
         c.world.platforms[0].extensions += " cl_khr_fp64";
         c.world.platforms[0].devices[0].doublePrecision = 0;
         c.error = c.platformText("Intel(R) Corporation") + c.deviceText();
     }},
    {"NoDoubleByExtensionOn10",
     [](StartUp& c) {
         c.world.platforms[0].version = "OpenCL 1.0";
         c.error = c.platformText("Intel(R) Corporation") + c.deviceText();
         c.doublePrecision = false;
     }},
    {"ExtensionFailsOn10AndCountsAsNone",
     [](StartUp& c) {
         c.world.platforms[0].version = "OpenCL 1.0";
         c.world.platforms[0].extensions += " cl_khr_fp64";
         c.faults = {{.function = "clGetPlatformInfo", .nth = 10, .onwards = true}};
         c.error = c.platformText("Intel(R) Corporation") + c.deviceText();
         c.doublePrecision = false;
     }},
    {"NoDoubleByDeviceOn12",
     [](StartUp& c) {
         c.world.platforms[0].devices[0].doublePrecision = 0;
         c.environment = {{"VYRA_OPENCL_OFF_WITHOUT_DOUBLE_SUPPORT", "0"}};
         c.doublePrecision = false;
     }},
    {"DoubleDemandedAndThere",
     [](StartUp& c) {
         c.environment = {{"VYRA_OPENCL_OFF_WITHOUT_DOUBLE_SUPPORT", "1"}};
     }},
    {"DoubleDemandedAndMissing",
     [](StartUp& c) {
         c.world.platforms[0].devices[0].doublePrecision = 0;
         c.environment = {{"VYRA_OPENCL_OFF_WITHOUT_DOUBLE_SUPPORT", "-1"}};
         c.stopsWithContext("Choosing OpenCL Device Scripted GPU.  Device Type: GPU  Device is "
                            "available.\n" +
                            kNoDouble);
     }},
    {"DriverRefused",
     [](StartUp& c) {
         onNVIDIA(c, "365.10");
         c.stopsBeforeDevice(kDriverRange);
         c.provider = kNVIDIAProvider;
         c.minimumBufferSize = 2000;
         c.device = "device#1";
     }},
    {"DriverUnreadable",
     [](StartUp& c) {
         onNVIDIA(c, "abc");
         c.error = c.platformText("NVIDIA Corporation") +
                   "Unable to detect NVidia driver version.  Disabling asynchronous read-back for "
                   "OpenCL.\n" +
                   c.deviceText();
         c.provider = kNVIDIAProvider;
         c.minimumBufferSize = 2000;
         c.asyncReadback = false;
         c.modes = {1, 2};
     }},
    {"DriverVersionFails",
     [](StartUp& c) {
         onNVIDIA(c, "400.00");
         c.fails("clGetDeviceInfo", 2);
         c.stopsBeforeDevice("");
         c.provider = kNVIDIAProvider;
         c.minimumBufferSize = 2000;
         c.device = "device#1";
     }},
    {"OlderDriverQueriesEvents",
     [](StartUp& c) {
         onNVIDIA(c, "385.30");
         c.provider = kNVIDIAProvider;
         c.minimumBufferSize = 2000;
         c.modes = {1, 2};
     }},
    {"IgnoredOlderDriverIsImplicit",
     [](StartUp& c) {
         onNVIDIA(c, "365.10");
         c.environment = {{"VYRA_OPENCL_IGNORE_DRIVER_VERSION", "1"}};
         c.provider = kNVIDIAProvider;
         c.minimumBufferSize = 2000;
     }},
    {"ModesFromTheEnvironment",
     [](StartUp& c) {
         c.environment = {{"VYRA_GRAPHICSTOOPENCL_SYNC_MODE", "2"},
                          {"VYRA_OPENCLTOGRAPHICS_SYNC_MODE", "3"}};
         c.modes = {2, 3};
     }},
    {"OneRetryOfTheQueue",
     [](StartUp& c) { c.faults = {{.function = "clCreateCommandQueue", .status = -35}}; }},
    {"RetryOfTheQueueFails", [](StartUp& c) { primaryQueueFails(c, -30, 2, "CL_INVALID_VALUE"); }},
    {"NoRetryForOtherStatuses",
     [](StartUp& c) { primaryQueueFails(c, -6, 1, "CL_OUT_OF_HOST_MEMORY"); }},
    {"QueuePropertiesFail",
     [](StartUp& c) {
         primaryQueueFails(c, 0, 0, "CL_OUT_OF_RESOURCES");
         c.faults = {{.function = "clGetDeviceInfo", .nth = 6}};
     }},
    {"SecondaryQueueFails",
     [](StartUp& c) {
         c.fails("clCreateCommandQueue", 2);
         c.left = {"context#1 x1", "queue#1 x1"};
     }},
    {"ComputeUnitsFail", [](StartUp& c) { c.fails("clGetDeviceInfo", 8); }},
};

class DeviceStartUp : public StartUpTest, public ::testing::WithParamInterface<StartUpRow> {};

TEST_P(DeviceStartUp, PrintsAnswersAndLeaves)
{
    StartUp expected;
    expected.error = expected.platformText("Intel(R) Corporation") + expected.deviceText();
    GetParam().set(expected);
    run(expected);
}
INSTANTIATE_TEST_SUITE_P(StartUp, DeviceStartUp, ::testing::ValuesIn(kDeviceRows), rowName);

using DeviceStartUpOnce = ScriptedTest;

TEST_F(DeviceStartUpOnce, ComputeUnitsComeLastButTheHost)
{
    ASSERT_TRUE(startWatched());
    EXPECT_EQ(calls().back(), "initializeOffset()");
    EXPECT_EQ(TopenCLInfo::theOne().computeUnitCount(), 8U);
}

TEST_F(DeviceStartUpOnce, TheHostIsNotToldWhenComputeUnitsFail)
{
    faults = {{.function = "clGetDeviceInfo", .nth = 8}};
    EXPECT_TRUE(startWatched());
    EXPECT_EQ(callsOf("initializeOffset"), Lines{});
    EXPECT_EQ(TopenCLInfo::theOne().computeUnitCount(), 0U);
    EXPECT_EQ(warnings(), Lines{kOutOfResources});
}

// The display entry of each window system, by its number.
class DisplayStartUp : public ScriptedTest,
                       public ::testing::WithParamInterface<GLDisplayProperty> {};

TEST_P(DisplayStartUp, DeviceQueryAndContextGetTheSamePropertyList)
{
    host().display = GetParam();
    ASSERT_TRUE(startWatched());

    Lines lines = calls();
    std::erase_if(lines, [](const std::string& line) {
        return line.find('{') == std::string::npos && !line.starts_with("glDisplayProperty");
    });
    std::ostringstream list;
    list << "{0x2008: 5, 0x" << std::hex << GetParam().name << ": 77, 0x1084: platform#1}";
    EXPECT_EQ(lines, (Lines{"glDisplayProperty(ptr)",
                            "clGetGLContextInfoKHR(" + list.str() + ", 8199, 512)",
                            "clGetGLContextInfoKHR(" + list.str() + ", 8198, 8)",
                            "clCreateContext(" + list.str() + ", [device#1], null) = context#1"}));
}
INSTANTIATE_TEST_SUITE_P(WGL_GLX_EGL, DisplayStartUp,
                         ::testing::Values(GLDisplayProperty{0x200B, 77},
                                           GLDisplayProperty{0x200A, 77},
                                           GLDisplayProperty{0x2009, 77}));

} // namespace
