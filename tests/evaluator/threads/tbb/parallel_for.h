// Replaces oneTBB: see global_control.h.
#pragma once

#include "global_control.h"

#include <cstddef>
#include <thread>
#include <vector>

namespace tbb {

template <typename Function>
void parallel_for(std::size_t first, std::size_t last, const Function& function)
{
    const std::size_t step = global_control::threads();
    const auto run = [&](std::size_t start) {
        for (std::size_t i = start; i < last; i += step)
            function(i);
    };
    if (step == 1)
        return run(first);
    std::vector<std::jthread> threads;
    for (std::size_t thread = 0; thread < step; ++thread)
        threads.emplace_back([&run, start = first + thread] { run(start); });
}

} // namespace tbb
