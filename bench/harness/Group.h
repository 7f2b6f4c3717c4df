// Groups of cases that are compared with each other.
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
    std::string thirdParty = {}; // name of the third-party library that is measured; else empty
};

// The first case is the baseline: as a rule, the direct OpenCL calls that the others must make. The
// bodies own the data of the cases.
struct Group {
    std::string name;
    std::vector<Case> cases;
    bool usesThreads = false;
};

// Creates a group when it is its turn, so that groups do not affect each other.
struct GroupFactory {
    std::string name;
    std::function<Group()> make;
};
