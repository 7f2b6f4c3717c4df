// The number of rounds of stress tests.
#pragma once

#include <algorithm>
#include <cstdlib>

// Returns the environment variable GLSHARE_STRESS_ROUNDS, at least 1; `defaultRounds` if it is not
// set.
inline int stressRounds(int defaultRounds)
{
    const char* value = std::getenv("GLSHARE_STRESS_ROUNDS");
    return value == nullptr ? defaultRounds : std::max(1, std::atoi(value));
}
