// Goals for the cost of operations, and the verdicts on them.
#pragma once

#include "harness/Statistics.h"

#include <optional>
#include <string>

struct Goal {
    enum class Kind {
        kReported,         // no limit
        kRatio,            // to the baseline
        kExtraNanoseconds, // in addition to the baseline, per operation
        kNanoseconds,      // per operation, independent of the baseline
    };
    Kind kind = Kind::kReported;
    double limit = 0;

    static Goal ratio(double limit) { return {Kind::kRatio, limit}; }
    static Goal extraNanoseconds(double limit) { return {Kind::kExtraNanoseconds, limit}; }
    static Goal nanoseconds(double limit) { return {Kind::kNanoseconds, limit}; }
};

// The measurement of one case, and its relation to the baseline of the group.
struct Measurement {
    Spread nanoseconds;                     // per operation
    Spread ratio;                           // to the baseline of the same round
    Spread extraNanoseconds;                // minus the baseline of the same round
    std::optional<double> instructions;     // per operation
    std::optional<double> instructionRatio; // to the baseline
};

enum class Verdict {
    kReported,    // there is no limit
    kMet,         // the median is within the limit
    kMetByCount,  // undecided by the times; the instruction counts are within the limit
    kWithinNoise, // undecided by the times, and there are no counts
    kMissed, // the 10th percentile is above the limit, or undecided and the counts are above it
};

// Returns the verdict. If the limit of a ratio lies between the 10th percentile and the median, the
// instruction counts decide.
[[nodiscard]] Verdict judge(const Goal& goal, const Measurement& measurement);

std::string textOf(const Goal& goal);
std::string textOf(Verdict verdict);
