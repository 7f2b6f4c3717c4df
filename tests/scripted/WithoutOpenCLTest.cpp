// Start-up if the OpenCL library is missing or incomplete.
#include "Platform.h"
#include "runtime/TopenCLInfo.h"

#include <filesystem>
#include <fstream>
#include <iterator>
#include <sstream>
#include <string>
#include <vector>

#include <gtest/gtest.h>

namespace {

// The functions of OpenCL 1.0 that the library calls.
constexpr const char* kRequired =
    "clBuildProgram clCreateBuffer clCreateCommandQueue "
    "clCreateContext clCreateKernel clCreateProgramWithSource "
    "clEnqueueMapBuffer clEnqueueReadBuffer clEnqueueWriteBuffer "
    "clEnqueueUnmapMemObject clFinish clFlush "
    "clGetDeviceInfo clGetEventInfo clGetPlatformIDs "
    "clGetExtensionFunctionAddress clGetPlatformInfo clGetKernelWorkGroupInfo "
    "clGetProgramBuildInfo clReleaseEvent clReleaseKernel "
    "clReleaseMemObject clReleaseProgram clRetainEvent "
    "clRetainKernel clRetainMemObject clRetainProgram "
    "clWaitForEvents";

std::vector<std::string> requiredFunctions()
{
    std::istringstream names(kRequired);
    return {std::istream_iterator<std::string>(names), {}};
}

std::string printedByStartUp()
{
    testing::internal::CaptureStderr();
    EXPECT_FALSE(TopenCLInfo::initialize(nullptr, nullptr, nullptr, false, false, 0x8086));
    return testing::internal::GetCapturedStderr();
}

void expectNothingLoaded()
{
    EXPECT_EQ(printedByStartUp(), "OpenCL evaluator is attempting to initialize OpenCL.\n"
                                  "OpenCL evaluator failed to initialize clew.\n");
}

// Loads a copy of the scripted runtime without this symbol. The library then gets this copy when it
// opens OpenCL by name, because it is loaded already.
void loadRuntimeWithout(const std::string& function)
{
    const std::filesystem::path original = VYRA_FAKE_OPENCL;
    const std::filesystem::path folder = testing::TempDir() + "vyra-without-" + function;
    std::filesystem::create_directories(folder);
    std::ifstream input(original, std::ios::binary);
    std::string bytes{std::istreambuf_iterator<char>(input), {}};
    // Changes the last letter: the table of names stays sorted.
    const std::string name = '\0' + function + '\0';
    for (std::size_t at = bytes.find(name); at != std::string::npos; at = bytes.find(name, at + 1))
        bytes[at + function.size()] = '_';
    const std::filesystem::path copy = folder / original.filename();
    std::ofstream(copy, std::ios::binary) << bytes;
    EXPECT_NE(loadLibrary(copy.string().c_str()), nullptr);
    std::error_code inUse; // Windows cannot remove a loaded library
    std::filesystem::remove_all(folder, inUse);
}

// CTest puts a file that is not a library on the search path.
TEST(WithoutOpenCL, StartUpStopsAndHostCallsDoNothing)
{
    expectNothingLoaded();
    TopenCLInfo::finish();
    TopenCLInfo::flush();
    EXPECT_FALSE(TopenCLInfo::isValid());
    EXPECT_TRUE(TopenCLInfo::IsEventComplete(nullptr));
    EXPECT_EQ(TopenCLInfo::theOne().createOpenCLCommandQueue(nullptr), nullptr);
    std::size_t global = 3;
    std::size_t local = 4;
    EXPECT_EQ(TopenCLInfo::theOne().getWorkGroupSizes(nullptr, 1, global, local),
              CL_DEVICE_NOT_FOUND);
    EXPECT_EQ(global + local, 7U) << "written despite the failure";
}

class WithoutOneFunction : public ::testing::TestWithParam<std::string> {};

TEST_P(WithoutOneFunction, StartUpStops)
{
    loadRuntimeWithout(GetParam());
    expectNothingLoaded();
}
INSTANTIATE_TEST_SUITE_P(OpenCL, WithoutOneFunction, ::testing::ValuesIn(requiredFunctions()),
                         [](const auto& row) { return row.param; });

TEST(WithoutOpenCL, MissingUncalledFunctionIsAccepted)
{
    loadRuntimeWithout("clReleaseContext");
    EXPECT_NE(printedByStartUp().find("failed to find OpenCL device"), std::string::npos);
}

} // namespace
