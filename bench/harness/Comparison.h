// Runs the cases of a group beside each other.
#pragma once

#include "harness/Group.h"

#include <random>
#include <string>
#include <vector>

// How much is measured.
struct Effort {
    int rounds = 31;
    Nanoseconds sample = std::chrono::milliseconds(4); // of each case in each round
};

struct CaseResult {
    std::string name;
    Goal goal;
    Measurement measurement;
    std::string peer = {}; // as the case has it
};

struct GroupResult {
    std::string name;
    std::vector<CaseResult> cases; // the baseline first
    Spread control;                // the ratio of the baseline to itself: the noise
};

// Every case once a round, in random order, and ratios taken inside the round, so that what
// disturbs the machine for longer than a round disturbs all cases alike. The baseline runs twice a
// round; the two against each other are the control.
GroupResult compare(const Group& group, const Effort& effort, std::mt19937& random);

// Runs each case under the tool that counts instructions; see InstructionCount.h. Leaves out groups
// that use several threads, whose instructions depend on how they meet.
void count(const Group& group);
