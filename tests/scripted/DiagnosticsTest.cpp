// Names of status codes, and the warnings that quote them.
#include "ScriptedTest.h"
#include "diagnostics/CLErrorCodes.h"
#include "diagnostics/CLInternalWarning.h"
#include "diagnostics/CLWarningSink.h"

#include <array>
#include <climits>
#include <cwchar>
#include <map>
#include <thread>
#include <utility>

#include <CL/cl_gl.h>

using namespace scripted;

namespace {

// The codes are those of the OpenCL headers.
#define STATUS(name)                                                                               \
    {                                                                                              \
        name, #name                                                                                \
    }
// clang-format off
const std::pair<int, const char*> kStatuses[] = {
    STATUS(CL_SUCCESS), STATUS(CL_DEVICE_NOT_FOUND), STATUS(CL_DEVICE_NOT_AVAILABLE),
    STATUS(CL_COMPILER_NOT_AVAILABLE), STATUS(CL_MEM_OBJECT_ALLOCATION_FAILURE),
    STATUS(CL_OUT_OF_RESOURCES), STATUS(CL_OUT_OF_HOST_MEMORY),
    STATUS(CL_PROFILING_INFO_NOT_AVAILABLE), STATUS(CL_MEM_COPY_OVERLAP),
    STATUS(CL_IMAGE_FORMAT_MISMATCH), STATUS(CL_IMAGE_FORMAT_NOT_SUPPORTED),
    STATUS(CL_BUILD_PROGRAM_FAILURE), STATUS(CL_MAP_FAILURE),
    STATUS(CL_MISALIGNED_SUB_BUFFER_OFFSET), STATUS(CL_EXEC_STATUS_ERROR_FOR_EVENTS_IN_WAIT_LIST),
    STATUS(CL_INVALID_VALUE), STATUS(CL_INVALID_DEVICE_TYPE), STATUS(CL_INVALID_PLATFORM),
    STATUS(CL_INVALID_DEVICE), STATUS(CL_INVALID_CONTEXT), STATUS(CL_INVALID_QUEUE_PROPERTIES),
    STATUS(CL_INVALID_COMMAND_QUEUE), STATUS(CL_INVALID_HOST_PTR), STATUS(CL_INVALID_MEM_OBJECT),
    STATUS(CL_INVALID_IMAGE_FORMAT_DESCRIPTOR), STATUS(CL_INVALID_IMAGE_SIZE),
    STATUS(CL_INVALID_SAMPLER), STATUS(CL_INVALID_BINARY), STATUS(CL_INVALID_BUILD_OPTIONS),
    STATUS(CL_INVALID_PROGRAM), STATUS(CL_INVALID_PROGRAM_EXECUTABLE),
    STATUS(CL_INVALID_KERNEL_NAME), STATUS(CL_INVALID_KERNEL_DEFINITION),
    STATUS(CL_INVALID_KERNEL), STATUS(CL_INVALID_ARG_INDEX), STATUS(CL_INVALID_ARG_VALUE),
    STATUS(CL_INVALID_ARG_SIZE), STATUS(CL_INVALID_KERNEL_ARGS), STATUS(CL_INVALID_WORK_DIMENSION),
    STATUS(CL_INVALID_WORK_GROUP_SIZE), STATUS(CL_INVALID_WORK_ITEM_SIZE),
    STATUS(CL_INVALID_GLOBAL_OFFSET), STATUS(CL_INVALID_EVENT_WAIT_LIST), STATUS(CL_INVALID_EVENT),
    STATUS(CL_INVALID_OPERATION), STATUS(CL_INVALID_GL_OBJECT), STATUS(CL_INVALID_BUFFER_SIZE),
    STATUS(CL_INVALID_MIP_LEVEL), STATUS(CL_INVALID_GLOBAL_WORK_SIZE),
    STATUS(CL_INVALID_GL_SHAREGROUP_REFERENCE_KHR),
    // Their header needs Windows, and its names end in _KHR.
    {-1006, "CL_INVALID_D3D11_DEVICE"},
    {-1007, "CL_INVALID_D3D11_RESOURCE"},
    {-1008, "CL_D3D11_RESOURCE_ALREADY_ACQUIRED"},
    {-1009, "CL_D3D11_RESOURCE_NOT_ACQUIRED"},
};
// clang-format on
#undef STATUS

TEST(ErrorNames, MatchHeadersElseNumber)
{
    std::map<int, std::string> expected{{INT_MIN, "-2147483648"}, {INT_MAX, "2147483647"}};
    for (int code = -1200; code <= 100; ++code)
        expected[code] = std::to_string(code);
    for (const auto& [code, name] : kStatuses)
        expected[code] = name;
    for (const auto& [code, name] : expected)
        EXPECT_EQ(CLErrorCodeStr(code), name);

    const char* text = CLErrorCodeStr(-15);
    EXPECT_EQ(text, CLErrorCodeStr(-16)) << "one buffer per thread, for the latest code";
    std::thread([text] { EXPECT_NE(CLErrorCodeStr(-17), text); }).join();
    EXPECT_STREQ(text, "-16");
}

using WarningTest = ScriptedTest;

TEST_F(WarningTest, WarningIsWholeOrEmptyWhenFormattingFails)
{
    testing::internal::CaptureStderr();
    testing::internal::CaptureStdout();
    const std::string part(5000, 'x');
    CLInternalWarning("%s %d %s", part.c_str(), 7, part.c_str());
    CLInternalWarning("OpenCL error: %s", CLErrorCodeStr(CL_OUT_OF_RESOURCES));
    CLInternalWarning("%lc", static_cast<wint_t>(0xD800)); // half of a surrogate pair
    EXPECT_EQ(warnings(), (Lines{part + " 7 " + part, "OpenCL error: CL_OUT_OF_RESOURCES", ""}));
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
    EXPECT_EQ(testing::internal::GetCapturedStdout(), "");
}

std::string lastText;
const CLWarningSink kKeepText = [](const char* text) { lastText = text; };
const CLWarningSink kDropText = [](const char*) {};

// Without the fixture, which replaces the built-in sink.
TEST(WarningSink, BuiltInSinkWritesNothingAndNullRestoresIt)
{
    testing::internal::CaptureStderr();
    testing::internal::CaptureStdout();
    CLInternalWarning("before");
    EXPECT_EQ(setCLWarningSink(kKeepText), nullptr) << "the built-in sink";
    CLInternalWarning("kept %d", 1);
    EXPECT_EQ(lastText, "kept 1");
    EXPECT_EQ(setCLWarningSink(kDropText), kKeepText);
    EXPECT_EQ(setCLWarningSink(nullptr), kDropText);
    CLInternalWarning("after");
    EXPECT_EQ(setCLWarningSink(nullptr), nullptr);
    EXPECT_EQ(lastText, "kept 1");
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
    EXPECT_EQ(testing::internal::GetCapturedStdout(), "");
}

// If two replacements returned the same sink, or none did, its owner could not restore it.
TEST(WarningSink, ConcurrentReplacementsReturnEachSinkOnce)
{
    constexpr int kReplacements = 2'000'000; // of each thread
    const std::array<CLWarningSink, 3> sinks = {nullptr, kDropText, [](const char*) {}};
    std::array<std::array<int, 3>, 3> returned{}; // by thread and sink
    const auto replace = [&](std::size_t thread) {
        for (int i = 0; i < kReplacements; ++i) {
            const auto before = std::ranges::find(sinks, setCLWarningSink(sinks[thread]));
            ++returned[thread][static_cast<std::size_t>(before - sinks.begin())];
            if (i % 1000 == 0) // rare, because warnings slow the replacements down
                CLInternalWarning("warning");
        }
    };
    std::thread other(replace, 1);
    replace(2);
    other.join();
    const CLWarningSink last = setCLWarningSink(nullptr);
    for (std::size_t sink = 1; sink < sinks.size(); ++sink)
        EXPECT_EQ(returned[1][sink] + returned[2][sink] + (last == sinks[sink] ? 1 : 0),
                  kReplacements);
}

} // namespace
