// What an operation may cost beside the runtime's own calls, and whether it stays within that.
#pragma once

#include "harness/Statistics.h"

#include <optional>
#include <string>

struct Goal {
    enum class Kind {
        kReported,         // no limit
        kRatio,            // times the baseline
        kExtraNanoseconds, // beyond the baseline, per operation
        kNanoseconds,      // per operation, whatever the baseline costs
    };
    Kind kind = Kind::kReported;
    double limit = 0;

    static Goal ratio(double limit) { return {Kind::kRatio, limit}; }
    static Goal extraNanoseconds(double limit) { return {Kind::kExtraNanoseconds, limit}; }
    static Goal nanoseconds(double limit) { return {Kind::kNanoseconds, limit}; }
};

// What was measured of one case, beside the baseline of its group.
struct Measurement {
    Spread nanoseconds;                     // per operation
    Spread ratio;                           // to the baseline of the same round
    Spread extraNanoseconds;                // the baseline of the same round taken off
    std::optional<double> instructions;     // per operation
    std::optional<double> instructionRatio; // to the baseline
};

enum class Verdict {
    kReported,    // there is no limit
    kMet,         // the median is within the limit
    kMetByCount,  // the times neither show nor refute it; the instruction counts are within it
    kWithinNoise, // the times neither show nor refute it, and no count decides
    kMissed,      // nine tenths of the rounds are beyond the limit, or the counts are as well
};

// A ratio whose times are undecided, which means that the limit lies between their percentiles, is
// judged by the instruction counts.
Verdict judge(const Goal& goal, const Measurement& measurement);

std::string textOf(const Goal& goal);
std::string textOf(Verdict verdict);
