// The FNV-1a hash of a byte sequence (Fowler, Noll and Vo; RFC 9923).
#pragma once

#include <cstdint>
#include <string_view>

namespace vyra::host {

template <class Word>
struct Fnv1aConstants;

template <>
struct Fnv1aConstants<std::uint32_t> {
    static constexpr std::uint32_t kOffsetBasis = 0x811c9dc5u;
    static constexpr std::uint32_t kPrime = 0x01000193u;
};

template <>
struct Fnv1aConstants<std::uint64_t> {
    static constexpr std::uint64_t kOffsetBasis = 0xcbf29ce484222325u;
    static constexpr std::uint64_t kPrime = 0x00000100000001b3u;
};

// Returns the hash of 32 or 64 bits.
template <class Word>
constexpr Word fnv1a(std::string_view bytes)
{
    Word hash = Fnv1aConstants<Word>::kOffsetBasis;
    for (const char byte : bytes) {
        hash ^= static_cast<unsigned char>(byte);
        hash *= Fnv1aConstants<Word>::kPrime;
    }
    return hash;
}

} // namespace vyra::host
