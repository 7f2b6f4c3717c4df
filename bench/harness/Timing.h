// The part of a case that is measured.
#pragma once

#include "harness/InstructionCount.h"

#include <chrono>
#include <cstddef>

using Nanoseconds = std::chrono::duration<double, std::nano>;

// The wall time of `operation`. What a case does outside of it is neither timed nor counted.
template <typename Operation>
Nanoseconds timed(Operation&& operation)
{
    const CountedScope counted;
    const auto begin = std::chrono::steady_clock::now();
    operation();
    return std::chrono::steady_clock::now() - begin;
}

// The wall time of `count` calls of `operation`.
template <typename Operation>
Nanoseconds timedLoop(std::size_t count, Operation&& operation)
{
    return timed([&] {
        for (std::size_t index = 0; index < count; ++index)
            operation();
    });
}

// Keeps the compiler from leaving out the computation of `value`.
template <typename Value>
void keep(const Value& value)
{
    asm volatile("" : : "r"(&value) : "memory");
}
