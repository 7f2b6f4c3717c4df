// Statuses and pages as people read them.
#include "tools/CapturedOutput.h"
#include "tools/Sheet.h"
#include "tools/StatusCodes.h"

#include <cstdio>

#include <gtest/gtest.h>

namespace {

TEST(Statuses, AreReadBackFromWarnings)
{
    struct Row {
        const char* warning;
        std::optional<int> status;
    };
    constexpr Row kRows[] = {
        {"OpenCL error: CL_OUT_OF_RESOURCES\n", -5},
        {"OpenCL error: CL_D3D11_RESOURCE_NOT_ACQUIRED", -1009},
        {"OpenCL error: -9999\n", -9999},
        {"OpenCL error: -1001", -1001},
        {"OpenCL error: no name", std::nullopt},
        {"a build log of CL_OUT_OF_RESOURCES", std::nullopt},
    };
    for (const Row& row : kRows)
        EXPECT_EQ(info::statusInWarning(row.warning), row.status) << row.warning;
}

TEST(Statuses, ShowNumberAndName)
{
    EXPECT_EQ(info::describeStatus(-5).find("CL_OUT_OF_RESOURCES (-5): "), 0U);
    EXPECT_EQ(info::describeStatus(-1001).find("CL_PLATFORM_NOT_FOUND_KHR (-1001): "), 0U);
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
    std::size_t begin = 0;
    int count = 0;
    while (begin < sheet.text().size()) {
        const std::size_t end = sheet.text().find('\n', begin);
        EXPECT_LE(end - begin, 110U);
        for (std::size_t at = begin; (at = sheet.text().find("word", at)) < end; ++at)
            ++count;
        begin = end + 1;
    }
    EXPECT_EQ(count, 60);
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

} // namespace
