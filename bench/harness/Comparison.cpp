#include "harness/Comparison.h"

#include "harness/InstructionCount.h"

#include <algorithm>
#include <numeric>

#include <sys/resource.h>

namespace {

using Clock = std::chrono::steady_clock;

// Iterations are doubled until a run of the case fills a sample; one whose unmeasured part takes
// this many times longer is not made longer for its measured part's sake.
constexpr double kMostUnmeasured = 8;

// A counted case repeats some times, so that storage that grows now and then is shared among its
// operations, but not for longer than the slow counting allows.
constexpr double kMostCountedIterations = 64;
constexpr double kMostCountedOperations = 4096;

std::size_t countedIterations(const Case& subject)
{
    const double affordable = kMostCountedOperations / subject.operationsPerIteration;
    return static_cast<std::size_t>(std::clamp(affordable, 1.0, kMostCountedIterations));
}

std::size_t iterationsFor(const Body& body, Nanoseconds sample)
{
    for (std::size_t iterations = 1;; iterations *= 2) {
        const auto begin = Clock::now();
        const Nanoseconds measured = body(iterations);
        const Nanoseconds whole = Clock::now() - begin;
        if (measured >= sample || whole >= kMostUnmeasured * sample) {
            const double share = std::min(sample / measured, kMostUnmeasured * sample / whole);
            return std::max<std::size_t>(
                1, static_cast<std::size_t>(static_cast<double>(iterations) * share));
        }
    }
}

// How often a thread of the program lost its processor to others.
long preemptions()
{
    rusage usage{};
    getrusage(RUSAGE_SELF, &usage);
    return usage.ru_nivcsw;
}

// Other programs that take the processor away in the middle of a sample spoil it: it is taken anew,
// though not for ever.
constexpr int kMostAttempts = 10;

Nanoseconds undisturbed(const Body& body, std::size_t iterations)
{
    for (int attempt = 1;; ++attempt) {
        const long before = preemptions();
        const Nanoseconds time = body(iterations);
        if (attempt == kMostAttempts || preemptions() == before)
            return time;
    }
}

// One case on its way through the rounds: its nanoseconds per operation, round by round.
struct Series {
    const Case* subject;
    std::size_t iterations;
    std::vector<double> nanoseconds;

    void sample()
    {
        const double operations = static_cast<double>(iterations) * subject->operationsPerIteration;
        nanoseconds.push_back(undisturbed(subject->body, iterations).count() / operations);
    }
};

template <typename Operation>
Spread pairwise(const Series& series, const Series& baseline, Operation operation)
{
    std::vector<double> results(series.nanoseconds.size());
    std::transform(series.nanoseconds.begin(), series.nanoseconds.end(),
                   baseline.nanoseconds.begin(), results.begin(), operation);
    return spreadOf(std::move(results));
}

CaseResult resultOf(const Series& series, const Series& baseline)
{
    CaseResult result{series.subject->name, series.subject->goal, {}, series.subject->peer};
    result.measurement.nanoseconds = spreadOf(series.nanoseconds);
    result.measurement.ratio = pairwise(series, baseline, std::divides<>());
    result.measurement.extraNanoseconds = pairwise(series, baseline, std::minus<>());
    return result;
}

} // namespace

GroupResult compare(const Group& group, const Effort& effort, std::mt19937& random)
{
    std::vector<Series> series;
    for (const Case& subject : group.cases)
        series.push_back({&subject, iterationsFor(subject.body, effort.sample), {}});
    series.push_back({&group.cases.front(), series.front().iterations, {}});

    std::vector<std::size_t> order(series.size());
    std::iota(order.begin(), order.end(), 0);
    for (int round = 0; round < effort.rounds; ++round) {
        std::shuffle(order.begin(), order.end(), random);
        for (const std::size_t index : order)
            series[index].sample();
    }

    GroupResult result{group.name, {}, {}};
    result.control = pairwise(series.back(), series.front(), std::divides<>());
    series.pop_back();
    for (const Series& one : series)
        result.cases.push_back(resultOf(one, series.front()));
    return result;
}

void count(const Group& group)
{
    if (group.usesThreads)
        return;
    for (const Case& subject : group.cases) {
        const std::size_t iterations = countedIterations(subject);
        subject.body(iterations); // warms up
        startInstructionCount();
        subject.body(iterations);
        writeInstructionCount(group.name + ": " + subject.name,
                              static_cast<double>(iterations) * subject.operationsPerIteration);
    }
}
