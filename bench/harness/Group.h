// Cases that stand beside each other.
#pragma once

#include "harness/Goal.h"
#include "harness/Timing.h"

#include <functional>
#include <string>
#include <vector>

// Runs a number of iterations and returns the time of the measured part.
using Body = std::function<Nanoseconds(std::size_t iterations)>;

struct Case {
    std::string name;
    Body body;
    Goal goal = {};
    double operationsPerIteration = 1;
    std::string peer = {}; // the other library that this measures; empty for ours and bare calls
};

// The first case is the baseline, as a rule the bare OpenCL calls that the others must make. What
// the cases work on lives in their bodies, so it goes with the group.
struct Group {
    std::string name;
    std::vector<Case> cases;
    bool usesThreads = false;
};

// Groups are made one at a time, when their turn comes, so that they do not disturb each other.
struct GroupMaker {
    std::string name;
    std::function<Group()> make;
};
