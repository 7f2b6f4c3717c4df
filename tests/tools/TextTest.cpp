// What people type, and statuses and pages as they read them.
#include "tools/info/Options.h"
#include "tools/info/diagnostics/CapturedOutput.h"
#include "tools/info/diagnostics/WarningLog.h"
#include "tools/info/report/ReportWriter.h"
#include "tools/info/text/StatusCodes.h"

#include "diagnostics/CLInternalWarning.h"
#include "diagnostics/CLWarningSink.h"

#include <algorithm>
#include <cstdio>
#include <iterator>
#include <sstream>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

TEST(Options, AreReadInBothForms)
{
    std::string problem;
    const auto options = info::parseOptions(
        {"--platform=Some Vendor", "--device-vendor", "0X10DE", "--json"}, problem);
    ASSERT_TRUE(options) << problem;
    EXPECT_EQ(options->platform, "Some Vendor");
    EXPECT_EQ(options->deviceVendor, 0x10DEU);
    EXPECT_TRUE(options->json);
    EXPECT_EQ(info::parseOptions({"--device-vendor=0123"}, problem)->deviceVendor, 123U);
}

TEST(Options, WrongOnesAreRefusedWithAReason)
{
    for (const char* wrong :
         {"--platform", "--platform=", "--device-vendor", "--device-vendor=10de",
          "--device-vendor=", "--device-vendor=0x", "--device-vendor=-1",
          "--device-vendor=99999999999", "--json=1", "report", "--verbose"}) {
        std::string problem;
        EXPECT_FALSE(info::parseOptions({"--json", wrong}, problem)) << wrong;
        EXPECT_FALSE(problem.empty()) << wrong;
    }
}

TEST(Statuses, AreReadBackFromWarnings)
{
    const std::pair<const char*, std::optional<int>> rows[] = {
        {"OpenCL error: CL_OUT_OF_RESOURCES\n", -5},
        {"OpenCL error: CL_D3D11_RESOURCE_NOT_ACQUIRED", -1009},
        {"OpenCL error: -9999\n", -9999},
        {"OpenCL error: -1001", -1001},
        {"OpenCL error: no name", std::nullopt},
        {"a build log of CL_OUT_OF_RESOURCES", std::nullopt},
    };
    for (const auto& [warning, status] : rows)
        EXPECT_EQ(info::statusInWarning(warning), status) << warning;
}

TEST(Statuses, ShowNumberAndName)
{
    EXPECT_THAT(info::describeStatus(-1001),
                testing::StartsWith("CL_PLATFORM_NOT_FOUND_KHR (-1001): "));
    EXPECT_EQ(info::describeStatus(-12345), "status -12345, which no OpenCL header names");
    EXPECT_EQ(info::describeStatus(-62), "CL_INVALID_MIP_LEVEL (-62)");
}

TEST(Sheet, BreaksLongValuesBetweenWords)
{
    info::Sheet sheet;
    std::string words;
    for (int i = 0; i < 60; ++i)
        words += "word ";
    sheet.row("Label", words);
    sheet.row("Empty", "");
    std::istringstream lines(sheet.text());
    for (std::string line; std::getline(lines, line);)
        EXPECT_LE(line.size(), 110U);
    std::istringstream read(sheet.text());
    EXPECT_EQ(std::count(std::istream_iterator<std::string>(read), {}, "word"), 60);
    EXPECT_TRUE(sheet.text().ends_with("\n  Empty\n"));
}

TEST(CapturedOutput, KeepsTheOrderOfBothStreamsAndPutsThemBack)
{
    info::CapturedOutput outer;
    {
        info::CapturedOutput inner;
        std::fprintf(stderr, "one ");
        std::printf("two ");
        std::fflush(stdout);
        std::fprintf(stderr, "three");
        std::printf(" four"); // left in the stream's buffer
        EXPECT_EQ(inner.finish(), "one two three four");
    }
    std::printf("back");
    EXPECT_EQ(outer.finish(), "back");
}

TEST(WarningLog, KeepsTextsWithoutLineBreaksAndRestoresTheSinkBefore)
{
    const CLWarningSink before = [](const char*) {};
    setCLWarningSink(before);
    {
        info::WarningLog log;
        CLInternalWarning("one\n");
        CLInternalWarning("two");
        EXPECT_EQ(log.take(), (std::vector<std::string>{"one", "two"}));
        EXPECT_TRUE(log.take().empty());
    }
    EXPECT_EQ(setCLWarningSink(nullptr), before);
}

} // namespace
