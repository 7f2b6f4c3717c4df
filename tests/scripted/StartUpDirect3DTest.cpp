// Start-up with a Direct3D 11 renderer: the two extensions and their entry points.
#include "ManagerTest.h"
#include "StartUpCase.h"

using namespace scripted;

namespace {

const char* const kNV = "cl_nv_d3d11_sharing";
const char* const kKHR = "cl_khr_d3d11_sharing";
const char* const kBoth = "cl_khr_d3d11_sharing cl_nv_d3d11_sharing";
const char* const kNVIncomplete =
    "Error: found cl_nv_d3d11_sharing extension but failed to get function pointers.";
const char* const kKHRIncomplete =
    "Error: found cl_khr_d3d11_sharing extension but failed to get function pointers.";

// The first device is chosen, whatever its type; no variable changes the modes.
StartUp onDirect3D(const char* extensions, const char* missing)
{
    StartUp c;
    c.onDirect3D(extensions);
    c.firstDevice().type = CL_DEVICE_TYPE_CPU;
    c.platform().devices.emplace_back();
    c.machine.d3dDevices = {0, 1};
    c.machine.missing = {missing};
    c.environment = {{"VYRA_OPENCL_FORCE_FINISH", "1"}, {"VYRA_GRAPHICSTOOPENCL_SYNC_MODE", "2"}};
    c.error = c.platformText() + kNamed + "Device Type: Non-GPU  Device is available.\n\n";
    return c;
}

// A missing entry point is reported on standard output.
void incomplete(StartUp& c, const char* extensions, const char* missing, const char* output)
{
    c = onDirect3D(extensions, missing);
    c.stopsBeforeDevice("");
    c.table = std::string(missing).starts_with("clGetDeviceIDs") ? "" : "devices";
    c.output = output;
}

// Rows are kept on one line.
// clang-format off
const StartUpRow kDirect3DRows[] = {
    {"NV", [](StartUp& c) { c = onDirect3D(kNV, ""); }},
    {"KHR", [](StartUp& c) { c = onDirect3D(kKHR, ""); }},
    {"WithoutOpenGL", [](StartUp& c) { c = onDirect3D(kNV, "clGetGLContextInfoKHR"); }}, // only OpenGL needs it
    {"OnNVIDIA", [](StartUp& c) { c.onNVIDIA("400.00"); c.onDirect3D(kNV); }},
    {"Neither", [](StartUp& c) {
         c = onDirect3D("cl_khr_gl_sharing", "");
         c.stopsBeforeDevice("Error: using D3D11 but found no OpenCL/D3D11 interop extension.");
         c.table = ""; }},
    {"StoppedBeforeTheModes", [](StartUp& c) {
         c.onDirect3D(kNV);
         c.arguments.usingGLCoreProfile = false;
         c.environment = {{"VYRA_DISABLE_OPENCL", "1"}};
         c.stopsBeforePlatform("OpenCL initialization has been disabled by user\n"); }},
    {"NVWithoutDevices", [](StartUp& c) { incomplete(c, kNV, "clGetDeviceIDsFromD3D11NV", kNVIncomplete); }},
    {"NVWithoutCreate", [](StartUp& c) { incomplete(c, kNV, "clCreateFromD3D11BufferNV", kNVIncomplete); }},
    {"NVWithoutAcquire", [](StartUp& c) { incomplete(c, kNV, "clEnqueueAcquireD3D11ObjectsNV", kNVIncomplete); }},
    {"NVWithoutRelease", [](StartUp& c) { incomplete(c, kBoth, "clEnqueueReleaseD3D11ObjectsNV", kNVIncomplete); }},
    {"KHRWithoutDevices", [](StartUp& c) { incomplete(c, kKHR, "clGetDeviceIDsFromD3D11KHR", kKHRIncomplete); }},
    {"KHRWithoutCreate", [](StartUp& c) { incomplete(c, kKHR, "clCreateFromD3D11BufferKHR", kKHRIncomplete); }},
    {"KHRWithoutAcquire", [](StartUp& c) { incomplete(c, kKHR, "clEnqueueAcquireD3D11ObjectsKHR", kKHRIncomplete); }},
    {"KHRWithoutRelease", [](StartUp& c) { incomplete(c, kKHR, "clEnqueueReleaseD3D11ObjectsKHR", kKHRIncomplete); }},
    {"NoDevice", [](StartUp& c) { c.onDirect3D(kNV); c.machine.d3dDevices.clear(); c.stopsBeforeDevice(""); }},
    {"DeviceQueryFails", [](StartUp& c) { c.onDirect3D(kKHR); c.stopsBeforeDevice(""); c.fails("clGetDeviceIDsFromD3D11KHR"); }},
};
// clang-format on
INSTANTIATE_TEST_SUITE_P(Direct3D, StartUpRows, ::testing::ValuesIn(kDirect3DRows), kName);

using Extensions = std::pair<const char*, const char*>; // of the platform, and the suffix in use
class Direct3DFunctions : public ManagerTest, public ::testing::WithParamInterface<Extensions> {};

// The device query, the property list and the functions that create and transfer a shared buffer.
TEST_P(Direct3DFunctions, AreTakenFromSupportedExtension)
{
    machine.platforms[0].extensions = GetParam().first;
    const std::string suffix = GetParam().second;
    arguments.usingDX = true;
    ASSERT_TRUE(startWatched());
    EXPECT_EQ(callsOf("clGetDeviceIDs", "clCreateContext", "glDisplayProperty"),
              (Lines{"clGetDeviceIDsFromD3D11" + suffix + "(platform#1, 16409, 5, 16411, 64)",
                     "clCreateContext({0x401d: 5, 0x1084: platform#1}, [device#1], null) = "
                     "context#1"}));

    makeManager();
    int status = 1;
    // NOLINTNEXTLINE(performance-no-int-to-ptr): an ID3D11Buffer, never dereferenced.
    const auto* buffer = manager().CreateSharedCLBuffer(context(), CL_MEM_READ_WRITE,
                                                        reinterpret_cast<void*>(9), &status);
    ASSERT_TRUE(buffer);
    acquire(buffer);
    release(buffer);
    EXPECT_EQ(callsOf("cl"),
              (Lines{"clCreateFromD3D11Buffer" + suffix + "(context#1, 1, 9) = mem#1",
                     "clEnqueueAcquireD3D11Objects" + suffix + "(queue#1, [mem#1], [])",
                     "clEnqueueReleaseD3D11Objects" + suffix + "(queue#1, [mem#1], [])"}));
}

INSTANTIATE_TEST_SUITE_P(Direct3D, Direct3DFunctions,
                         ::testing::Values(Extensions{kNV, "NV"}, Extensions{kKHR, "KHR"},
                                           Extensions{kBoth, "NV"}));

} // namespace
