// The host's identifier of one evaluation of its graph.
#pragma once

#include <cstdint>

namespace em {

// Carries 16 bits. 0xFFFE never names an evaluation.
class Id {
public:
    explicit constexpr Id(std::uint16_t value) : fValue(value) {}
    constexpr std::uint16_t value() const { return fValue; }

private:
    std::uint16_t fValue;
};

} // namespace em
