// Options, texts of the reports, and the capture of output and warnings.
#include "tools/info/Options.h"
#include "tools/info/diagnostics/CapturedOutput.h"
#include "tools/info/diagnostics/WarningLog.h"
#include "tools/info/report/ReportWriter.h"
#include "tools/info/text/StatusCodes.h"

#include "diagnostics/CLInternalWarning.h"
#include "diagnostics/CLStatusReport.h"
#include "diagnostics/CLWarningSink.h"

#include <cstdio>
#include <tuple>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

TEST(Options, ParseOptionsAcceptsBothFormsOfValues)
{
    std::string problem;
    const auto options = info::parseOptions(
        {"info", "--platform=Some Vendor", "--device-vendor", "0X10DE", "--json"}, problem);
    ASSERT_TRUE(options) << problem;
    EXPECT_EQ(options->platform, "Some Vendor");
    EXPECT_EQ(options->deviceVendor, 0x10DEU);
    EXPECT_TRUE(options->json);
    EXPECT_EQ(info::parseOptions({"info", "--device-vendor=0123"}, problem)->deviceVendor, 123U);
}

TEST(Options, ParseOptionsRejectsWrongArgumentsWithReason)
{
    for (const char* wrong :
         {"--platform", "--platform=", "--device-vendor", "--device-vendor=10de",
          "--device-vendor=", "--device-vendor=0x", "--device-vendor=-1",
          "--device-vendor=99999999999", "--json=1", "report", "--verbose"}) {
        std::string problem;
        EXPECT_FALSE(info::parseOptions({"info", "--json", wrong}, problem)) << wrong;
        EXPECT_FALSE(problem.empty()) << wrong;
    }
}

TEST(StatusCodes, DescribeStatusReturnsNameNumberAndMeaning)
{
    EXPECT_THAT(info::describeStatus(-1001),
                testing::StartsWith("CL_PLATFORM_NOT_FOUND_KHR (-1001): "));
    EXPECT_EQ(info::describeStatus(-12345), "status -12345, which no OpenCL header names");
    EXPECT_EQ(info::describeStatus(-62), "CL_INVALID_MIP_LEVEL (-62)");
}

TEST(ReportWriter, LongValueIsWrappedBetweenWords)
{
    info::ReportWriter writer;
    const std::string first(60, 'a');
    const std::string second(60, 'b');
    writer.row("Label", first + " " + second);
    writer.row("Empty", "");
    EXPECT_EQ(writer.text(), "  Label" + std::string(31, ' ') + first + "\n" +
                                 std::string(38, ' ') + second + "\n  Empty\n");
}

TEST(CapturedOutput, FinishReturnsBothStreamsInOrderAndRestoresThem)
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

TEST(WarningLog, TakeReturnsTextsAndStatusesAndDestructionRestoresSink)
{
    const CLWarningSink before = [](const char*) {};
    setCLWarningSink(before);
    {
        info::WarningLog log;
        enterStartUpStep(StartUpStep::kContext);
        reportFailure(-9999, CLReportStyle::kWithLineBreak);
        CLInternalWarning("two");
        const std::vector<info::Warning> warnings = log.take();
        ASSERT_EQ(warnings.size(), 2U);
        EXPECT_EQ(std::tie(warnings[0].text, warnings[0].status, warnings[0].step),
                  std::tuple("OpenCL error: -9999", -9999, StartUpStep::kContext));
        EXPECT_EQ(std::tie(warnings[1].text, warnings[1].status), std::tuple("two", CL_SUCCESS));
        EXPECT_TRUE(log.take().empty());
    }
    EXPECT_EQ(setCLWarningSink(nullptr), before);
}

} // namespace
