#include "host/Tplug.h"

namespace {

// One step of SplitMix64: a bijection that spreads every input bit over all output bits. Steele,
// Lea and Flood, "Fast Splittable Pseudorandom Number Generators", OOPSLA 2014.
constexpr std::uint64_t splitMix(std::uint64_t x)
{
    x += 0x9e3779b97f4a7c15u;
    x = (x ^ (x >> 30)) * 0xbf58476d1ce4e5b9u;
    x = (x ^ (x >> 27)) * 0x94d049bb133111ebu;
    return x ^ (x >> 31);
}

} // namespace

constinit const Tplug Tplug::fsNULL{};

std::uint64_t Tplug::hash() const
{
    return splitMix(splitMix(fNode) ^ fAttribute);
}
