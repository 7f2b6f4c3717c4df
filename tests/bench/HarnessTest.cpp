// The harness of the benchmarks. The bodies of the cases return made-up times; nothing is timed.
#include "harness/InstructionCount.h"
#include "harness/Report.h"

#include <algorithm>
#include <fstream>
#include <sstream>
#include <tuple>

#include <QTemporaryDir>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using testing::AllOf, testing::HasSubstr, testing::Not;

constexpr Effort kEffort{5, std::chrono::microseconds(10)};

TEST(Comparison, CompareReturnsTimesPerOperationAndRatiosToBaseline)
{
    std::size_t longest = 0;
    // Returns this time per iteration.
    const auto pretending = [&longest](double nanoseconds) -> Body {
        return [=, &longest](std::size_t iterations) {
            longest = std::max(longest, iterations);
            return Nanoseconds(nanoseconds) * static_cast<double>(iterations);
        };
    };
    std::mt19937 random;
    const std::vector<Case> cases{{"direct", pretending(200), {}, 2},
                                  {"twice", pretending(800), {}, 4},
                                  {"half", pretending(50), {}, 1, "another"}};
    const GroupResult result = compare({"group", cases}, kEffort, random);
    ASSERT_EQ(result.cases.size(), 3u);
    EXPECT_DOUBLE_EQ(result.cases[0].measurement.nanoseconds.median, 100);
    EXPECT_DOUBLE_EQ(result.cases[1].measurement.nanoseconds.median, 200);
    EXPECT_DOUBLE_EQ(result.cases[1].measurement.ratio.median, 2);
    EXPECT_DOUBLE_EQ(result.cases[1].measurement.extraNanoseconds.median, 100);
    EXPECT_DOUBLE_EQ(result.cases[2].measurement.ratio.high, 0.5);
    EXPECT_EQ(result.cases[2].thirdParty, "another");
    EXPECT_DOUBLE_EQ(result.control.median, 1);
    EXPECT_GE(longest, 200u) << "10 us of 50 ns each";
    EXPECT_LE(longest, 400u) << "no more than one doubling too far";
}

TEST(Comparison, CompareRunsEachCaseOncePerRoundAndBaselineTwice)
{
    std::vector<int> order;
    // Each call takes longer than the previous one, so the control is not 1.
    const auto noting = [&order](int number) -> Body {
        return [&order, number](std::size_t iterations) {
            order.push_back(number);
            return kEffort.sample * static_cast<double>(iterations + order.size());
        };
    };
    std::mt19937 random(1);
    const std::vector<Case> cases{{"0", noting(0)}, {"1", noting(1)}, {"2", noting(2)}};
    const Spread control = compare({"group", cases}, kEffort, random).control;
    EXPECT_NE(control.low, control.high);
    order.erase(order.begin(), order.begin() + 3); // the calls that determined the iterations
    // A preempted sample is repeated, so these are minimum numbers.
    EXPECT_GE(std::count(order.begin(), order.end(), 0), 2 * kEffort.rounds);
    EXPECT_GE(std::count(order.begin(), order.end(), 1), kEffort.rounds);
    EXPECT_GE(std::count(order.begin(), order.end(), 2), kEffort.rounds);
    const auto backwards = [](int one, int next) { return next == one - 1; };
    EXPECT_NE(std::adjacent_find(order.begin(), order.end(), backwards), order.end())
        << "the order is random";
}

TEST(Statistics, PercentileInterpolatesBetweenSamplesInAnyOrder)
{
    const std::vector<double> sorted{10, 20, 30, 40, 50};
    EXPECT_DOUBLE_EQ(percentile(sorted, 0), 10);
    EXPECT_DOUBLE_EQ(percentile(sorted, 1), 50);
    EXPECT_DOUBLE_EQ(percentile({7}, 0.9), 7);
    const auto [median, low, high] = spreadOf({50, 10, 40, 20, 30, 60});
    EXPECT_THAT((std::vector{low, median, high}), testing::ElementsAre(15, 35, 55));
    EXPECT_DOUBLE_EQ(spreadOf({}).median, 0);
}

TEST(Verdicts, JudgeDependsOnGoalAndMeasurement)
{
    const auto times = [](double median, double extra) {
        return Measurement{{median, median, median}, {9, 9, 9}, {extra, extra, extra}, {}, {}};
    };
    const auto ratios = [](double low, double median, double high,
                           std::optional<double> byCount = {}) {
        return Measurement{{}, {median, low, high}, {}, {}, byCount};
    };
    const Goal ratio = Goal::ratio(1.2);
    const std::tuple<const char*, Goal, Measurement, Verdict> rows[] = {
        {"no goal", {}, ratios(5, 6, 7), Verdict::kReported},
        {"at the limit", ratio, ratios(1.1, 1.2, 1.9), Verdict::kMet},
        {"within, counts beyond", ratio, ratios(1.0, 1.1, 1.3, 1.5), Verdict::kMet},
        {"beyond, counts within", ratio, ratios(1.3, 1.4, 1.5, 1.1), Verdict::kMissed},
        {"undecided, no counts", ratio, ratios(1.1, 1.3, 1.5), Verdict::kWithinNoise},
        {"undecided, counts within", ratio, ratios(1.1, 1.3, 1.5, 1.2), Verdict::kMetByCount},
        {"undecided, counts beyond", ratio, ratios(1.1, 1.3, 1.5, 1.21), Verdict::kMissed},
        {"extra time within", Goal::extraNanoseconds(5), times(100, 4), Verdict::kMet},
        {"extra time beyond", Goal::extraNanoseconds(5), times(100, 6), Verdict::kMissed},
        {"time within", Goal::nanoseconds(1000), times(900, 800), Verdict::kMet},
        {"time beyond", Goal::nanoseconds(1000), times(1100, 800), Verdict::kMissed},
    };
    for (const auto& [description, goal, measurement, verdict] : rows)
        EXPECT_EQ(judge(goal, measurement), verdict) << description;
}

std::vector<GroupResult> someResults(double ratio)
{
    CaseResult ours{"ours", Goal::ratio(1.2), {}};
    ours.measurement.ratio = {ratio, ratio - 0.05, ratio + 0.05};
    return {{"group", {{"direct", {}, {}}, ours}, {1, 0.98, 1.03}}};
}

std::string tableOf(const std::vector<GroupResult>& results)
{
    std::ostringstream output;
    writeTable(output, results);
    return output.str();
}

TEST(Results, TableMarksMissedGoalsAndThirdPartyBaselines)
{
    EXPECT_THAT(tableOf(someResults(1.1)), AllOf(HasSubstr("met"), Not(HasSubstr("MISS"))));
    auto results = someResults(1.3);
    EXPECT_THAT(tableOf(results), HasSubstr("MISSED"));
    results[0].cases[1].thirdParty = "another";
    EXPECT_THAT(tableOf(results), AllOf(HasSubstr("third party |"), Not(HasSubstr("MISS"))));
    const QJsonValue json = toJson(RunDescription{}, results)["groups"][0]["cases"];
    EXPECT_EQ(json[1]["thirdParty"].toString(), "another");
    EXPECT_TRUE(json[0]["thirdParty"].isUndefined());
}

TEST(ResultFiles, ReadInstructionCountsReturnsCountPerOperationByCase)
{
    const QTemporaryDir folder;
    const std::pair<const char*, const char*> files[] = {
        {"out.1", "desc: Trigger: Client Request: 64 group: direct\nsummary: 6400\n"},
        {"out.2", "desc: Trigger: Client Request: 32 group: ours\nsummary: 4800 7\n"},
        {"out.3", "desc: Trigger: Program termination\nsummary: 99\n"},
        {"notes", "not a count\n"},
    };
    for (const auto& [name, text] : files)
        std::ofstream(folder.filePath(name).toStdString()) << text;
    const auto counts = readInstructionCounts(folder.path().toStdString());
    EXPECT_EQ(counts,
              (std::map<std::string, double>{{"group: direct", 100}, {"group: ours", 150}}));

    auto results = someResults(1.25);
    addInstructionCounts(results, counts);
    EXPECT_THAT(tableOf(results), HasSubstr("1.500")) << "the ratio by count";
}

TEST(ResultFiles, WriteChangesMarksChangesBeyondNoiseAndReadRejectsOtherFiles)
{
    const QTemporaryDir folder;
    const std::filesystem::path path = folder.filePath("run.json").toStdString();
    EXPECT_THROW(readRatios(path), std::runtime_error) << "no such file";
    std::ofstream(path) << "{\"groups\": 3}";
    EXPECT_THROW(readRatios(path), std::runtime_error);

    ASSERT_TRUE(writeJson(path, toJson(RunDescription{}, someResults(1.5))));
    const auto earlier = readRatios(path);
    EXPECT_DOUBLE_EQ(earlier.at("group: ours"), 1.5);
    const auto changes = [&](double ratio) {
        std::ostringstream output;
        writeChanges(output, someResults(ratio), earlier);
        return output.str();
    };
    EXPECT_THAT(changes(1.2), AllOf(HasSubstr("-20.0 %"), HasSubstr("faster")));
    EXPECT_THAT(changes(1.8), AllOf(HasSubstr("20.0 %"), HasSubstr("SLOWER")));
    EXPECT_THAT(changes(1.52), AllOf(Not(HasSubstr("SLOWER")), Not(HasSubstr("faster"))))
        << "within the noise";
}

} // namespace
