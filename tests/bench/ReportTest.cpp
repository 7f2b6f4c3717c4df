// Tables, JSON and the files of instruction counts.
#include "harness/Report.h"
#include "harness/InstructionCount.h"
#include "harness/Table.h"

#include <fstream>
#include <sstream>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using testing::HasSubstr;
using testing::Not;

std::vector<GroupResult> someResults(double ratio)
{
    CaseResult bare{"bare", {}, {}};
    bare.measurement.nanoseconds = {100, 90, 110};
    bare.measurement.ratio = {1, 1, 1};
    CaseResult ours{"ours", Goal::ratio(1.2), {}};
    ours.measurement.nanoseconds = {100 * ratio, 100 * ratio, 100 * ratio};
    ours.measurement.ratio = {ratio, ratio - 0.05, ratio + 0.05};
    return {{"group", {bare, ours}, {1, 0.98, 1.03}}};
}

// A folder of its own for each test.
class ReportFiles : public testing::Test {
protected:
    void SetUp() override { std::filesystem::create_directories(fFolder); }
    void TearDown() override { std::filesystem::remove_all(fFolder); }

    void write(const char* name, const std::string& text) { std::ofstream(fFolder / name) << text; }

    const std::filesystem::path fFolder =
        std::filesystem::path(testing::TempDir()) /
        testing::UnitTest::GetInstance()->current_test_info()->name();
};

std::string tableOf(const std::vector<GroupResult>& results)
{
    std::ostringstream output;
    writeTable(output, results);
    return output.str();
}

TEST(Table, ColumnsAreAligned)
{
    Table table({"name", "n"});
    table.add({"a", "1"});
    table.add({"long name", "12345"});
    std::ostringstream output;
    table.write(output);
    EXPECT_EQ(output.str(), "| name      |     n |\n"
                            "| --------- | ----: |\n"
                            "| a         |     1 |\n"
                            "| long name | 12345 |\n");
}

TEST_F(ReportFiles, InstructionCountsArePerOperationAndByCase)
{
    write("out.1", "desc: Trigger: Client Request: 64 group: bare\nsummary: 6400\n");
    write("out.2", "desc: Trigger: Client Request: 32 group: ours\nsummary: 4800 7\n");
    write("out.3", "desc: Trigger: Program termination\nsummary: 99\n");
    write("notes", "nothing of the kind\n");
    const auto counts = readInstructionCounts(fFolder);
    EXPECT_EQ(counts, (std::map<std::string, double>{{"group: bare", 100}, {"group: ours", 150}}));

    auto results = someResults(1.25);
    addInstructionCounts(results, counts);
    EXPECT_EQ(results[0].cases[1].measurement.instructionRatio, 1.5);
    EXPECT_THAT(tableOf(results), HasSubstr("1.500"));
}

TEST_F(ReportFiles, ARunComparesWithAnEarlierOne)
{
    const auto path = fFolder / "run.json";
    ASSERT_TRUE(writeJson(path, toJson(RunDescription{}, someResults(1.5))));
    const auto earlier = readRatios(path);
    EXPECT_DOUBLE_EQ(earlier.at("group: ours"), 1.5);

    const auto changes = [&](double ratio) {
        std::ostringstream output;
        writeChanges(output, someResults(ratio), earlier);
        return output.str();
    };
    EXPECT_THAT(changes(1.2), testing::AllOf(HasSubstr("-20.0 %"), HasSubstr("faster")));
    EXPECT_THAT(changes(1.8), testing::AllOf(HasSubstr("20.0 %"), HasSubstr("SLOWER")));
    EXPECT_THAT(changes(1.52), testing::AllOf(Not(HasSubstr("SLOWER")), Not(HasSubstr("faster"))))
        << "within the noise";
}

TEST_F(ReportFiles, WhatIsNoRunIsRefused)
{
    write("other.json", "{\"groups\": 3}");
    EXPECT_THROW(readRatios(fFolder / "other.json"), std::runtime_error);
    EXPECT_THROW(readRatios(fFolder / "absent.json"), std::runtime_error);
}

TEST(Results, AMissedGoalStandsOut)
{
    EXPECT_THAT(tableOf(someResults(1.3)), HasSubstr("MISSED"));
    EXPECT_THAT(tableOf(someResults(1.1)),
                testing::AllOf(HasSubstr("met"), Not(HasSubstr("MISS"))));
}

} // namespace
