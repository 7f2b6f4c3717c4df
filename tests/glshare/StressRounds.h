// How often the tests that attack the layer repeat what they do.
#pragma once

#include <algorithm>
#include <cstdlib>

// The environment variable GLSHARE_STRESS_ROUNDS, at least 1; `usual` if it is not set.
inline int stressRounds(int usual)
{
    const char* value = std::getenv("GLSHARE_STRESS_ROUNDS");
    return value == nullptr ? usual : std::max(1, std::atoi(value));
}
