#include "buffers/TopenCLData.h"

#include <cstdint>

namespace {

// FNV-1a, 64 bits; offset basis and prime from its authors (Fowler, Noll, Vo).
std::uint64_t fnv1a(std::uint64_t value)
{
    std::uint64_t hash = 0xcbf29ce484222325u;
    for (int byte = 0; byte < 8; ++byte) {
        hash ^= (value >> (8 * byte)) & 0xffu;
        hash *= 0x100000001b3u;
    }
    return hash;
}

} // namespace

std::size_t TopenCLData::KeyHash::operator()(const Key& key) const
{
    const std::uint64_t h = key.second.hash();
    return h ^ (fnv1a(key.first.hash()) + 0x9e3779b9u + (h << 6) + (h >> 2));
}

TopenCLData::TopenCLData() = default;
TopenCLData::TopenCLData(const TopenCLData& other) = default;
TopenCLData::~TopenCLData() = default;

TopenCLData& TopenCLData::operator=(const TopenCLData& other)
{
    if (this == &other)
        return *this;
    try {
        fMap = other.fMap;
    } catch (...) {
        // The container would keep the entries copied before the failure.
        fMap.clear();
        throw;
    }
    return *this;
}

const TopenCLDataBuffer& TopenCLData::getData(const TuniqueString& name, const Tplug& plug) const
{
    const auto entry = fMap.find(Key(name, plug));
    return entry == fMap.end() ? TopenCLDataBuffer::fsNULL : entry->second;
}

void TopenCLData::setData(const TuniqueString& name, const Tplug& plug,
                          const TopenCLDataBuffer& buffer)
{
    // With insert, unlike emplace, the container creates its node after everything that can fail.
    const auto [entry, inserted] = fMap.insert(Map::value_type(Key(name, plug), buffer));
    if (!inserted)
        entry->second = buffer;
}

const Tplug& TopenCLData::getSinglePlug() const
{
    const Tplug* single = nullptr;
    for (const auto& [key, buffer] : fMap) {
        if (!single)
            single = &key.second;
        else if (key.second != *single)
            return Tplug::fsNULL;
    }
    return single ? *single : Tplug::fsNULL;
}

bool TopenCLData::empty() const
{
    return fMap.empty();
}

TopenCLData::iterator TopenCLData::begin()
{
    return fMap.begin();
}
TopenCLData::iterator TopenCLData::end()
{
    return fMap.end();
}
TopenCLData::const_iterator TopenCLData::begin() const
{
    return fMap.begin();
}
TopenCLData::const_iterator TopenCLData::end() const
{
    return fMap.end();
}
TopenCLData::const_iterator TopenCLData::cbegin() const
{
    return fMap.cbegin();
}
TopenCLData::const_iterator TopenCLData::cend() const
{
    return fMap.cend();
}

const TuniqueString& TopenCLData::sPositionsName()
{
    return sfPositionsName;
}
const TuniqueString& TopenCLData::sNormalsName()
{
    return sfNormalsName;
}
const TuniqueString& TopenCLData::sGeometryMatrixName()
{
    return sfGeometryMatrixName;
}
const TuniqueString& TopenCLData::sInverseGeometryMatrixName()
{
    return sfInverseGeometryMatrixName;
}
const TuniqueString& TopenCLData::sNormalIdxToPositionIdxName()
{
    return sfNormalIdxToPositionIdxName;
}
