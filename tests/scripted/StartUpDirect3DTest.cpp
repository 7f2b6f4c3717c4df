// Start-up with a Direct3D 11 renderer: the two extensions and their entry points.
#include "StartUpCase.h"
#include "runtime/TopenCLInfo.h"

using namespace scripted;

namespace {

struct D3DRow {
    const char* name;
    const char* extensions;
    const char* missing; // entry point left out, or ""
    const char* error;   // printed last, on standard error, or ""
    const char* output;  // on standard output
    const char* suffix;  // of the functions in use, or ""
};
void PrintTo(const D3DRow& row, std::ostream* out)
{
    *out << row.name;
}

const char* const kNV = "cl_nv_d3d11_sharing";
const char* const kKHR = "cl_khr_d3d11_sharing";
const char* const kBoth = "cl_khr_d3d11_sharing cl_nv_d3d11_sharing";
const char* const kNVIncomplete =
    "Error: found cl_nv_d3d11_sharing extension but failed to get function pointers.";
const char* const kKHRIncomplete =
    "Error: found cl_khr_d3d11_sharing extension but failed to get function pointers.";

const D3DRow kRows[] = {
    {"NV", kNV, "", "", "", "NV"},
    {"KHR", kKHR, "", "", "", "KHR"},
    {"BothMeansNV", kBoth, "", "", "", "NV"},
    {"Neither", "cl_khr_gl_sharing", "",
     "Error: using D3D11 but found no OpenCL/D3D11 interop extension.", "", ""},
    {"NVWithoutDevices", kNV, "clGetDeviceIDsFromD3D11NV", "", kNVIncomplete, ""},
    {"NVWithoutCreate", kNV, "clCreateFromD3D11BufferNV", "", kNVIncomplete, ""},
    {"NVWithoutAcquire", kNV, "clEnqueueAcquireD3D11ObjectsNV", "", kNVIncomplete, ""},
    {"NVWithoutRelease", kBoth, "clEnqueueReleaseD3D11ObjectsNV", "", kNVIncomplete, ""},
    {"KHRWithoutDevices", kKHR, "clGetDeviceIDsFromD3D11KHR", "", kKHRIncomplete, ""},
    {"KHRWithoutCreate", kKHR, "clCreateFromD3D11BufferKHR", "", kKHRIncomplete, ""},
    {"KHRWithoutAcquire", kKHR, "clEnqueueAcquireD3D11ObjectsKHR", "", kKHRIncomplete, ""},
    {"KHRWithoutRelease", kKHR, "clEnqueueReleaseD3D11ObjectsKHR", "", kKHRIncomplete, ""},
    // What only OpenGL needs is not missed.
    {"WithoutOpenGL", kNV, "clGetGLContextInfoKHR", "", "", "NV"},
};

class Direct3DStartUp : public StartUpTest, public ::testing::WithParamInterface<D3DRow> {
protected:
    // The device's type is not examined, and no variable changes the modes.
    static StartUp describe(const D3DRow& row)
    {
        StartUp c;
        c.arguments.usingDX = true;
        c.platform().extensions = row.extensions;
        c.firstDevice().type = CL_DEVICE_TYPE_CPU;
        c.world.missing = {row.missing};
        c.environment = {{"VYRA_OPENCL_FORCE_FINISH", "1"},
                         {"VYRA_GRAPHICSTOOPENCL_SYNC_MODE", "2"}};
        c.error = c.platformText() + kNamed + "Device Type: Non-GPU  Device is available.\n\n";
        return c;
    }
    void usesFunctionsOf(const std::string& suffix);
};

// The device query, the property list and the functions behind a shared buffer's life.
void Direct3DStartUp::usesFunctionsOf(const std::string& suffix)
{
    Lines lines = calls();
    std::erase_if(lines, [](const std::string& line) {
        return !line.starts_with("clGetDeviceIDs") && !line.starts_with("clCreateContext");
    });
    EXPECT_EQ(lines,
              (Lines{"clGetDeviceIDsFromD3D11" + suffix + "(platform#1, 16409, 5, 16411, 64)",
                     "clCreateContext({0x401d: 5, 0x1084: platform#1}, [device#1], null) = "
                     "context#1"}));

    TopenCLInfo& info = TopenCLInfo::theOne();
    TopenCLSharedBufferMgr& manager = info.sharedBufferMgr();
    int status = 1;
    // NOLINTNEXTLINE(performance-no-int-to-ptr): an ID3D11Buffer, which nobody looks behind.
    const auto* buffer = manager.CreateSharedCLBuffer(info.openCLContext(), CL_MEM_READ_WRITE,
                                                      reinterpret_cast<void*>(9), &status);
    ASSERT_TRUE(buffer);
    const cl_mem mem = buffer->fMem.get();
    manager.EnqueueAcquireSharedCLBuffer(info.openCLCommandQueue(), buffer, nullptr);
    manager.EnqueueReleaseSharedCLBuffer(info.openCLCommandQueue(), 1, &mem, 0, nullptr, nullptr);
    manager.DestroySharedCLBuffer(buffer);
    EXPECT_EQ(callsOf("cl"),
              (Lines{"clCreateFromD3D11Buffer" + suffix + "(context#1, 1, 9) = mem#1",
                     "clEnqueueAcquireD3D11Objects" + suffix + "(queue#1, [mem#1], [])",
                     "clEnqueueReleaseD3D11Objects" + suffix + "(queue#1, [mem#1], [])",
                     "clReleaseMemObject(mem#1)"}));
}

TEST_P(Direct3DStartUp, ChoosesTheExtensionOrStops)
{
    const D3DRow& row = GetParam();
    StartUp expected = describe(row);
    if (row.suffix[0] == '\0')
        expected.stopsBeforeDevice(row.error);
    expected.output = row.output;
    run(expected);
    EXPECT_FALSE(TopenCLInfo::theOne().useGLFinish());
    if (row.suffix[0] != '\0')
        usesFunctionsOf(row.suffix);
}
INSTANTIATE_TEST_SUITE_P(StartUp, Direct3DStartUp, ::testing::ValuesIn(kRows),
                         [](const auto& row) { return std::string(row.param.name); });

using Direct3DDevices = StartUpTest;

TEST_F(Direct3DDevices, NoneStopsWithoutAWord)
{
    StartUp expected;
    expected.arguments.usingDX = true;
    expected.platform().extensions = kNV;
    expected.world.d3dDevices.clear();
    expected.stopsBeforeDevice("");
    run(expected);
}

TEST_F(Direct3DDevices, AFailingQueryIsReportedAndStops)
{
    StartUp expected;
    expected.arguments.usingDX = true;
    expected.platform().extensions = kKHR;
    expected.stopsBeforeDevice("");
    expected.fails("clGetDeviceIDsFromD3D11KHR");
    run(expected);
}

} // namespace
