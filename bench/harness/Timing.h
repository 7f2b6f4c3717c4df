// Measurement of the timed part of a case.
#pragma once

#include "harness/InstructionCount.h"

#include <chrono>
#include <cstddef>

using Nanoseconds = std::chrono::duration<double, std::nano>;

// Returns the wall time of `operation`. Work of the case outside of it is neither timed nor
// counted.
template <typename Operation>
Nanoseconds timed(Operation&& operation)
{
    const CountedScope counted;
    const auto begin = std::chrono::steady_clock::now();
    operation();
    return std::chrono::steady_clock::now() - begin;
}

// Returns the wall time of `count` calls of `operation`.
template <typename Operation>
Nanoseconds timedLoop(std::size_t count, Operation&& operation)
{
    return timed([&] {
        for (std::size_t index = 0; index < count; ++index)
            operation();
    });
}

// Prevents the compiler from removing the computation of `value`.
template <typename Value>
void keep(const Value& value)
{
    asm volatile("" : : "r"(&value) : "memory");
}
