// Start-up from the device to the kernel store: devices that share, context, report, precision,
// queues, compute units.
#include "StartUpCase.h"
#include "kernels/TopenCLKernelStore.h"
#include "runtime/SyncModes.h"

#include <numeric>

using namespace scripted;

namespace {

const std::string kNoGPU =
    "OpenCL evaluator is unable to find a GPU device that can share VBOs with OpenGL.\n";
const std::string kNoGL = "Error: found cl_khr_gl_sharing but failed to get function pointers";

// Three devices that share with OpenGL, the current one (-1: none), and the expected device.
void threeDevices(StartUp& c, const cl_device_type (&types)[3], int current, const char* device)
{
    c.platform().devices = {{.type = types[0]}, {.type = types[1]}, {.type = types[2]}};
    c.machine.glDevices = {0, 1, 2};
    c.machine.currentGLDevice.reset();
    if (current >= 0)
        c.machine.currentGLDevice = static_cast<std::size_t>(current);
    c.device = device;
}

// Makes the creation of the primary queue fail with this status.
void primaryQueueFails(StartUp& c, cl_int status, unsigned attempts, const std::string& name)
{
    for (unsigned nth = 1; nth <= attempts; ++nth)
        c.faults.push_back({.function = "clCreateCommandQueue", .status = status, .nth = nth});
    c.warnings = {"OpenCL error: " + name + "\n"};
    c.valid = false;
    c.left = {"context#1 x1", "queue#1 x1"};
}

void demandModes(StartUp& c, const char* graphicsToCL, const char* clToGraphics)
{
    c.environment = {{"VYRA_GRAPHICSTOOPENCL_SYNC_MODE", graphicsToCL},
                     {"VYRA_OPENCLTOGRAPHICS_SYNC_MODE", clToGraphics}};
}

void withoutGLFunction(StartUp& c, const char* name)
{
    c.machine.missing = {name};
    c.stopsWithContext(kNoGL);
    c.table = "";
}

void withoutEvents(StartUp& c, std::pair<int, int> modes)
{
    c.platform().extensions = "cl_khr_gl_sharing";
    c.modes = modes;
}

// Rows are kept on one line.
// clang-format off
const StartUpRow kDeviceRows[] = {
    {"CurrentDeviceOfTheList", [](StartUp& c) { threeDevices(c, {4, 4, 4}, 1, "device#2"); }},
    {"CurrentDeviceOutsideTheList", [](StartUp& c) { threeDevices(c, {2, 4, 4}, 2, "device#2"); c.machine.glDevices = {0, 1}; }},
    {"NoCurrentDevice", [](StartUp& c) { threeDevices(c, {2, 8, 4}, -1, "device#3"); }},
    {"CurrentDeviceNoGPU", [](StartUp& c) { threeDevices(c, {2, 4, 4}, 0, "device#2"); }},
    {"DefaultGPUIsNoGPU", [](StartUp& c) { threeDevices(c, {5, 2, 5}, 0, ""); c.stopsBeforeDevice(kNoGPU); }},
    {"LastOf64Devices", [](StartUp& c) {
         c.platform().devices.resize(64, {.type = CL_DEVICE_TYPE_CPU});
         c.firstDevice().type = CL_DEVICE_TYPE_CPU;
         c.platform().devices.back().type = CL_DEVICE_TYPE_GPU;
         c.machine.glDevices.resize(64);
         std::iota(c.machine.glDevices.begin(), c.machine.glDevices.end(), 0U);
         c.device = "device#64"; }},
    {"NoDeviceShares", [](StartUp& c) { c.machine.glDevices.clear(); c.stopsBeforeDevice(kNoGPU); }},
    {"UnwrittenTypeIsNoGPU", [](StartUp& c) { c.machine.emptyAnswers = {CL_DEVICE_TYPE}; c.stopsBeforeDevice(kNoGPU); }},
    {"UnwrittenDevicesAreNone", [](StartUp& c) { c.machine.emptyAnswers = {0x2007, 0x2006}; c.stopsBeforeDevice(kNoGPU); }},
    {"GLContextQueryMissing", [](StartUp& c) { c.machine.missing = {"clGetGLContextInfoKHR"}; c.stopsBeforeDevice(kNoGPU); }},
    {"GLDevicesFail", [](StartUp& c) { c.fails("clGetGLContextInfoKHR", 1); c.stopsBeforeDevice(""); }},
    {"CurrentGLDeviceFails", [](StartUp& c) { c.fails("clGetGLContextInfoKHR", 2); c.stopsBeforeDevice(""); }},
    {"TypeOfCurrentDeviceFails", [](StartUp& c) { c.fails("clGetDeviceInfo", 1); c.stopsBeforeDevice(""); }},
    {"TypeOfListedDeviceFails", [](StartUp& c) { c.machine.currentGLDevice.reset(); c.fails("clGetDeviceInfo", 1); c.stopsBeforeDevice(""); }},
    {"ContextFails", [](StartUp& c) { c.stopsBeforeDevice(""); c.fails("clCreateContext"); c.device = "device#1"; c.asyncReadback = true; }},
    {"ContextOfNothing", [](StartUp& c) {
         c.faults = {{.function = "clCreateContext", .status = CL_SUCCESS}};
         c.stopsWithContext(kReported);
         c.doublePrecision = true;
         c.left = {}; }},
    {"CreateFromGLMissing", [](StartUp& c) { withoutGLFunction(c, "clCreateFromGLBuffer"); }},
    {"AcquireGLMissing", [](StartUp& c) { withoutGLFunction(c, "clEnqueueAcquireGLObjects"); }},
    {"ReleaseGLMissing", [](StartUp& c) { withoutGLFunction(c, "clEnqueueReleaseGLObjects"); }},
    {"DeviceNameFails", [](StartUp& c) { c.fails("clGetDeviceInfo", 2); c.stopsWithContext(""); }},
    {"LongestDeviceName", [](StartUp& c) {
         c.firstDevice().name = std::string(127, 'n');
         c.error = c.platformText() + "Choosing OpenCL Device " + c.firstDevice().name + ".  Device Type: GPU  Device is available.\n\n"; }},
    {"DeviceNameTooLong", [](StartUp& c) {
         c.firstDevice().name = std::string(128, 'n');
         c.stopsWithContext("");
         c.warnings = {"OpenCL error: CL_INVALID_VALUE\n"};
         c.misuse = {"clGetDeviceInfo: the value is too small"}; }},
    {"DeviceTypeFails", [](StartUp& c) { c.fails("clGetDeviceInfo", 3); c.stopsWithContext(kNamed); }},
    {"AvailabilityFails", [](StartUp& c) { c.fails("clGetDeviceInfo", 4); c.stopsWithContext(kNamed + "Device Type: GPU  "); }},
    {"DeviceUnavailable", [](StartUp& c) {
         c.firstDevice().available = false;
         c.stopsWithContext(kNamed + "Device Type: GPU  GL shared device is not available, no OpenCL will be used\n"); }},
    {"PlatformVersionFails", [](StartUp& c) { c.fails("clGetPlatformInfo", 9); c.stopsWithContext(kReported); }},
    {"DoublePrecisionFails", [](StartUp& c) { c.fails("clGetDeviceInfo", 5); c.stopsWithContext(kReported); }},
    {"DoubleByExtensionOn11", [](StartUp& c) {
         c.platform().version = "OpenCL 1.10 scripted";
         c.platform().extensions += " xcl_khr_fp64x";
         c.firstDevice().doublePrecision = 0; }},
    {"NoDoubleByExtensionOn10", [](StartUp& c) { c.platform().version = "OpenCL 1.0 scripted"; c.withoutDoublePrecision(); }},
    {"FailingExtensionsOn10CountAsNone", [](StartUp& c) {
         c.platform().version = "OpenCL 1.0";
         c.platform().extensions += " cl_khr_fp64";
         c.faults = {{.function = "clGetPlatformInfo", .nth = 10, .onwards = true}};
         c.withoutDoublePrecision(); }},
    {"NoDoubleByDeviceOn12", [](StartUp& c) { c.firstDevice().doublePrecision = 0; c.withoutDoublePrecision(); }},
    {"DoubleDemandedAndThere", [](StartUp& c) { c.firstDevice().doublePrecision = CL_FP_DENORM; c.environment = {{"VYRA_OPENCL_OFF_WITHOUT_DOUBLE_SUPPORT", "1"}}; }},
    {"DoubleDemandedAndMissing", [](StartUp& c) {
         c.firstDevice().doublePrecision = 0;
         c.environment = {{"VYRA_OPENCL_OFF_WITHOUT_DOUBLE_SUPPORT", "-1"}};
         c.stopsWithContext(kReported + "Vyra OpenCL is not supported on device because double precision is not supported.\n");
         c.withoutDoublePrecision(); }},
    {"DriverRefused", [](StartUp& c) {
         c.onNVIDIA("365.10");
         c.stopsBeforeDevice("\nOpenCL is not supported by NVidia drivers between version 361.91 and 368.86.  To enabled "
                             "OpenCL for this driver version set VYRA_OPENCL_IGNORE_DRIVER_VERSION=1.\n");
         c.device = "device#1"; }},
    {"DriverUnreadableWhateverTheVariable", [](StartUp& c) {
         c.onNVIDIA("abc");
         c.error = c.platformText() + "Unable to detect NVidia driver version.  Disabling asynchronous read-back for OpenCL.\n" + kReported + "\n";
         c.asyncReadback = false;
         c.modes = {1, 2};
         c.environment = {{"VYRA_OPENCL_IGNORE_DRIVER_VERSION", "1"}}; }},
    {"DriverVersionFails", [](StartUp& c) { c.onNVIDIA("400.00"); c.fails("clGetDeviceInfo", 2); c.stopsBeforeDevice(""); c.device = "device#1"; }},
    {"OldDriverReadsBackSynchronously", [](StartUp& c) { c.onNVIDIA("359.90"); c.asyncReadback = false; c.modes = {1, 2}; }},
    {"IgnoredOlderDriverIsImplicit", [](StartUp& c) { c.onNVIDIA("365.10"); c.environment = {{"VYRA_OPENCL_IGNORE_DRIVER_VERSION", "1"}}; }},
    {"ModesFromTheEnvironment", [](StartUp& c) { demandModes(c, "2", "3"); c.modes = {2, 3}; }},
    {"ForceFinishTakesPrecedence", [](StartUp& c) {
         withoutEvents(c, {3, 4});
         demandModes(c, "1", "1");
         c.environment.emplace_back("VYRA_OPENCL_FORCE_FINISH", "-2"); }},
    {"ModesWithoutEvents", [](StartUp& c) { withoutEvents(c, {2, 2}); }},
    {"ExtensionsAreFoundAnywhereInTheText", [](StartUp& c) { c.platform().extensions = "xcl_khr_gl_eventx"; }},
    {"UnsupportedModesAreReported", [](StartUp& c) {
         withoutEvents(c, {1, 2});
         demandModes(c, "1", "1");
         c.error = c.platformText() + chooseGraphicsToCLSyncMode(1, {}).message +
                   chooseCLToGraphicsSyncMode(1, {}).message + kReported + "\n"; }},
    {"ModesWithoutSyncObjects", [](StartUp& c) {
         withoutEvents(c, {3, 2});
         c.prepareHost = [] { installFunctionTable(false, true); }; }},
    {"ModesWithoutFunctionTable", [](StartUp& c) { withoutEvents(c, {3, 2}); c.prepareHost = removeFunctionTable; }},
    {"OneRetryOfTheQueue", [](StartUp& c) { c.faults = {{.function = "clCreateCommandQueue", .status = -35}}; }},
    {"RetryOfTheQueueFails", [](StartUp& c) { primaryQueueFails(c, -30, 2, "CL_INVALID_VALUE"); }},
    {"NoRetryForOtherStatuses", [](StartUp& c) { primaryQueueFails(c, -6, 1, "CL_OUT_OF_HOST_MEMORY"); }},
    {"QueuePropertiesFail", [](StartUp& c) { primaryQueueFails(c, 0, 0, "CL_OUT_OF_RESOURCES"); c.faults = {{.function = "clGetDeviceInfo", .nth = 6}}; }},
    {"SecondaryQueueFails", [](StartUp& c) { c.fails("clCreateCommandQueue", 2); c.left = {"context#1 x1", "queue#1 x1"}; }},
    {"ComputeUnitsFail", [](StartUp& c) { c.fails("clGetDeviceInfo", 8); c.computeUnits = 0; }},
};
// clang-format on
INSTANTIATE_TEST_SUITE_P(Device, StartUpRows, ::testing::ValuesIn(kDeviceRows), kName);

using DeviceStartUpOnce = ScriptedTest;

TEST_F(DeviceStartUpOnce, StartUpWithoutQueueContinues)
{
    setEnvironment("VYRA_OPENCL_PLATFORM", "NVIDIA Corporation");
    machine.platforms[0].vendor = "NVIDIA Corporation";
    faults = {{.function = "clCreateCommandQueue"}};
    EXPECT_FALSE(startWatched());
    EXPECT_EQ(warnings(), Lines{kOutOfResources});
    EXPECT_EQ(calls().back(), "initializeOffset()");
    EXPECT_EQ(info().computeUnitCount(), 8U);
    EXPECT_TRUE(info().kernelStore().getKernelFromString("skin", "p", "", "skin", nullptr).get());
    EXPECT_THAT(callsOf("clBuildProgram"),
                ::testing::ElementsAre(::testing::HasSubstr("-cl-nv-verbose")));
    expectLeft({"program#1 x1", "kernel#1 x1"});
}

TEST_F(DeviceStartUpOnce, StartUpWithoutContextCreatesNoQueue)
{
    faults = {{.function = "clCreateContext"}};
    EXPECT_FALSE(start());
    EXPECT_EQ(warnings(), Lines{kOutOfResources});
    bool outOfOrder = true;
    EXPECT_EQ(info().createOpenCLCommandQueue(&outOfOrder), nullptr);
    EXPECT_FALSE(outOfOrder);
    EXPECT_EQ(calls(), Lines{});
}

TEST_F(DeviceStartUpOnce, SupportsThreadedSharingReadsVariableOnce)
{
    setEnvironment("VYRA_OPENCL_PLATFORM", "NVIDIA Corporation");
    machine.platforms[0].vendor = "NVIDIA Corporation";
    ASSERT_TRUE(start());
    EXPECT_FALSE(info().supportsThreadedSharing());
    setEnvironment("VYRA_OPENCL_FORCE_THREADING", "1");
    EXPECT_FALSE(info().supportsThreadedSharing());
    EXPECT_EQ(calls(), Lines{kForceThreading});
}

TEST_F(DeviceStartUpOnce, DeviceQueryAndContextReceiveHostsDisplay)
{
    host().display = {0x2009, 77}; // CL_EGL_DISPLAY_KHR; other tests have another one
    ASSERT_TRUE(startWatched());
    const std::string list = "{0x2008: 5, 0x2009: 77, 0x1084: platform#1}";
    EXPECT_EQ(callsOf("glDisplayProperty", "clGetGLContextInfo", "clCreateContext"),
              (Lines{"glDisplayProperty(3)", "clGetGLContextInfoKHR(" + list + ", 8199, 512)",
                     "clGetGLContextInfoKHR(" + list + ", 8198, 8)",
                     "clCreateContext(" + list + ", [device#1], null) = context#1"}));
}

} // namespace
