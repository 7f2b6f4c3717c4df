// How cases are run beside each other; the bodies tell times of their own, so nothing is timed
// here.
#include "harness/Comparison.h"

#include <algorithm>
#include <map>

#include <gtest/gtest.h>

namespace {

constexpr Effort kEffort{5, std::chrono::microseconds(10)};

// Says that it takes so long per iteration, and counts its calls.
Body pretending(Nanoseconds perIteration, int* calls = nullptr)
{
    return [=](std::size_t iterations) {
        if (calls)
            ++*calls;
        return perIteration * static_cast<double>(iterations);
    };
}

GroupResult run(const Group& group)
{
    std::mt19937 random(1);
    return compare(group, kEffort, random);
}

TEST(Comparison, TimesArePerOperationAndRatiosToTheBaseline)
{
    const GroupResult result = run({"group",
                                    {{"bare", pretending(Nanoseconds(200)), {}, 2},
                                     {"twice", pretending(Nanoseconds(800)), Goal::ratio(3), 4},
                                     {"half", pretending(Nanoseconds(50))}}});
    ASSERT_EQ(result.cases.size(), 3u);
    EXPECT_DOUBLE_EQ(result.cases[0].measurement.nanoseconds.median, 100);
    EXPECT_DOUBLE_EQ(result.cases[1].measurement.nanoseconds.median, 200);
    EXPECT_DOUBLE_EQ(result.cases[1].measurement.ratio.median, 2);
    EXPECT_DOUBLE_EQ(result.cases[1].measurement.extraNanoseconds.median, 100);
    EXPECT_DOUBLE_EQ(result.cases[2].measurement.ratio.high, 0.5);
    EXPECT_DOUBLE_EQ(result.control.median, 1);
}

TEST(Comparison, ControlShowsABaselineThatVaries)
{
    // Every call of the baseline takes longer than the one before.
    int calls = 0;
    const Body slowingDown = [&calls](std::size_t iterations) {
        return Nanoseconds(100.0 + ++calls) * static_cast<double>(iterations);
    };
    const GroupResult result = run({"group", {{"bare", slowingDown}}});
    EXPECT_NE(result.control.low, result.control.high);
}

TEST(Comparison, EveryCaseRunsOnceARoundAndTheBaselineTwice)
{
    // The operations of one look at all the cases, in the order in which they ran.
    std::vector<int> order;
    bool calibrated = false;
    const auto noting = [&](int number) -> Body {
        return [&, number](std::size_t iterations) {
            if (calibrated)
                order.push_back(number);
            return kEffort.sample * static_cast<double>(iterations);
        };
    };
    // The last case to be calibrated starts the notes.
    const Body last = [&](std::size_t iterations) {
        if (calibrated)
            order.push_back(2);
        calibrated = true;
        return kEffort.sample * static_cast<double>(iterations);
    };
    run({"group", {{"0", noting(0)}, {"1", noting(1)}, {"2", last}}});
    std::map<int, int> runs;
    for (const int number : order)
        ++runs[number];
    // A round that lost the processor runs a case again, so these are least numbers.
    EXPECT_GE(runs[0], 2 * kEffort.rounds);
    EXPECT_GE(runs[1], kEffort.rounds);
    EXPECT_GE(runs[2], kEffort.rounds);
    EXPECT_FALSE(std::is_sorted(order.begin(), order.end()));
}

TEST(Comparison, SamplesAreFilled)
{
    std::size_t longest = 0;
    const Body body = [&longest](std::size_t iterations) {
        longest = std::max(longest, iterations);
        return Nanoseconds(10.0) * static_cast<double>(iterations);
    };
    run({"group", {{"bare", body}}});
    EXPECT_GE(longest, 1000u) << "10 us of 10 ns each";
    EXPECT_LE(longest, 2048u) << "no more than one doubling too far";
}

} // namespace
