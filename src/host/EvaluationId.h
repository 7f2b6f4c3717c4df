// The host's identifier of one evaluation of its graph.
#pragma once

#include <cstdint>

namespace em {

// A 16-bit value. 0xFFFE is reserved: it identifies no evaluation.
class Id {
public:
    explicit constexpr Id(std::uint16_t value) : fValue(value) {}
    constexpr std::uint16_t value() const { return fValue; }

private:
    std::uint16_t fValue;
};

} // namespace em
