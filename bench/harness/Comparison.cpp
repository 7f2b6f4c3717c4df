#include "harness/Comparison.h"

#include "harness/InstructionCount.h"

#include <algorithm>
#include <numeric>

#include <sys/resource.h>

namespace {

using Clock = std::chrono::steady_clock;

// Iterations are doubled until the measured part of a run fills a sample, or the whole run takes
// this many samples.
constexpr double kMostUnmeasured = 8;

// A counted case is repeated, so that occasional growth of storage is averaged over its operations;
// limited, since counting is slow.
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

// Returns how often the system has preempted threads of this process.
long preemptions() noexcept
{
    rusage usage{};
    getrusage(RUSAGE_SELF, &usage);
    return usage.ru_nivcsw;
}

// A sample during which the process was preempted is repeated, up to this many attempts.
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

// The samples of one case: nanoseconds per operation in each round.
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
    CaseResult result{series.subject->name, series.subject->goal, {}, series.subject->thirdParty};
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
