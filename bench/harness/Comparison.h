// The comparison of the cases of a group.
#pragma once

#include "harness/Group.h"

#include <random>
#include <string>
#include <vector>

// The number and the length of samples.
struct Effort {
    int rounds = 31;
    Nanoseconds sample = std::chrono::milliseconds(4); // of each case in each round
};

struct CaseResult {
    std::string name;
    Goal goal;
    Measurement measurement;
    std::string thirdParty = {}; // as in Case
};

struct GroupResult {
    std::string name;
    std::vector<CaseResult> cases; // the baseline comes first
    Spread control;                // the ratio of the baseline to itself, which is the noise
};

// Measures all cases. Each runs once per round, in random order, and ratios are computed within a
// round: a disturbance that lasts longer than a round affects all cases alike. The baseline runs
// twice per round; the ratio of the two runs is the control.
[[nodiscard]] GroupResult compare(const Group& group, const Effort& effort, std::mt19937& random);

// Runs each case under the tool that counts instructions; see InstructionCount.h. Skips groups that
// use several threads, whose counts depend on timing.
void count(const Group& group);
