// What is concluded from samples: percentiles, and verdicts on goals.
#include "harness/Goal.h"

#include <ostream>

#include <gtest/gtest.h>

namespace {

TEST(Statistics, PercentilesLieBetweenTheSamplesAroundThem)
{
    const std::vector<double> sorted{10, 20, 30, 40, 50};
    EXPECT_DOUBLE_EQ(percentile(sorted, 0), 10);
    EXPECT_DOUBLE_EQ(percentile(sorted, 1), 50);
    EXPECT_DOUBLE_EQ(percentile(sorted, 0.1), 14);
    EXPECT_DOUBLE_EQ(percentile({7}, 0.9), 7);
}

TEST(Statistics, TheOrderOfTheSamplesMakesNoDifference)
{
    const Spread spread = spreadOf({50, 10, 40, 20, 30, 60});
    EXPECT_DOUBLE_EQ(spread.median, 35);
    EXPECT_DOUBLE_EQ(spread.low, 15);
    EXPECT_DOUBLE_EQ(spread.high, 55);
    EXPECT_DOUBLE_EQ(spreadOf({}).median, 0);
}

struct Row {
    const char* description;
    Goal goal;
    Measurement measurement;
    Verdict verdict;
};

void PrintTo(const Row& row, std::ostream* stream)
{
    *stream << row.description;
}

Measurement ratios(double low, double median, double high,
                   std::optional<double> byCount = std::nullopt)
{
    Measurement measurement;
    measurement.ratio = {median, low, high};
    measurement.instructionRatio = byCount;
    return measurement;
}

Measurement times(double nanoseconds, double extra)
{
    Measurement measurement;
    measurement.nanoseconds = {nanoseconds, nanoseconds, nanoseconds};
    measurement.extraNanoseconds = {extra, extra, extra};
    measurement.ratio = {9, 9, 9};
    return measurement;
}

class Verdicts : public testing::TestWithParam<Row> {};

TEST_P(Verdicts, FollowFromGoalAndMeasurement)
{
    EXPECT_EQ(judge(GetParam().goal, GetParam().measurement), GetParam().verdict);
}

INSTANTIATE_TEST_SUITE_P(
    Goals, Verdicts,
    testing::Values(
        Row{"no goal", {}, ratios(5, 6, 7), Verdict::kReported},
        Row{"at the limit", Goal::ratio(1.2), ratios(1.1, 1.2, 1.9), Verdict::kMet},
        Row{"the median decides, not the counts", Goal::ratio(1.2), ratios(1.0, 1.1, 1.3, 1.5),
            Verdict::kMet},
        Row{"all beyond, though the counts are within", Goal::ratio(1.2),
            ratios(1.3, 1.4, 1.5, 1.1), Verdict::kMissed},
        Row{"undecided, no counts", Goal::ratio(1.2), ratios(1.1, 1.3, 1.5), Verdict::kWithinNoise},
        Row{"undecided, counts within", Goal::ratio(1.2), ratios(1.1, 1.3, 1.5, 1.2),
            Verdict::kMetByCount},
        Row{"undecided, counts beyond", Goal::ratio(1.2), ratios(1.1, 1.3, 1.5, 1.21),
            Verdict::kMissed},
        Row{"extra time within", Goal::extraNanoseconds(5), times(100, 4), Verdict::kMet},
        Row{"extra time beyond", Goal::extraNanoseconds(5), times(100, 6), Verdict::kMissed},
        Row{"time within", Goal::nanoseconds(1000), times(900, 800), Verdict::kMet},
        Row{"time beyond", Goal::nanoseconds(1000), times(1100, 800), Verdict::kMissed}));

} // namespace
