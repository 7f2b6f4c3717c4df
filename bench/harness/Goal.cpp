#include "harness/Goal.h"

#include <cstdio>

namespace {

// Returns the quantity that the goal limits.
const Spread& limited(const Goal& goal, const Measurement& measurement)
{
    switch (goal.kind) {
    case Goal::Kind::kExtraNanoseconds:
        return measurement.extraNanoseconds;
    case Goal::Kind::kNanoseconds:
        return measurement.nanoseconds;
    default:
        return measurement.ratio;
    }
}

} // namespace

Verdict judge(const Goal& goal, const Measurement& measurement)
{
    if (goal.kind == Goal::Kind::kReported)
        return Verdict::kReported;
    const Spread& spread = limited(goal, measurement);
    if (spread.median <= goal.limit)
        return Verdict::kMet;
    if (spread.low > goal.limit)
        return Verdict::kMissed;
    if (goal.kind != Goal::Kind::kRatio || !measurement.instructionRatio)
        return Verdict::kWithinNoise;
    return *measurement.instructionRatio <= goal.limit ? Verdict::kMetByCount : Verdict::kMissed;
}

std::string textOf(const Goal& goal)
{
    char text[32] = "";
    switch (goal.kind) {
    case Goal::Kind::kReported:
        return "reported";
    case Goal::Kind::kRatio:
        std::snprintf(text, sizeof text, "%.2f", goal.limit);
        break;
    case Goal::Kind::kExtraNanoseconds:
        std::snprintf(text, sizeof text, "+%.0f ns", goal.limit);
        break;
    case Goal::Kind::kNanoseconds:
        std::snprintf(text, sizeof text, "%.0f ns", goal.limit);
        break;
    }
    return text;
}

std::string textOf(Verdict verdict)
{
    switch (verdict) {
    case Verdict::kReported:
        return "";
    case Verdict::kMet:
        return "met";
    case Verdict::kMetByCount:
        return "met by count";
    case Verdict::kWithinNoise:
        return "within noise";
    case Verdict::kMissed:
        break;
    }
    return "MISSED";
}
