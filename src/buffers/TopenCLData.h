// The data of one deformer evaluation.
#pragma once

#include "VyraOpenCLExport.h"
#include "buffers/TopenCLDataBuffer.h"
#include "host/Tplug.h"
#include "host/TuniqueString.h"

#include <cstddef>
#include <functional>
#include <utility>

#include <tbb/concurrent_unordered_map.h>
#include <tbb/tbb_allocator.h>

// A concurrent map from a data name and a plug to a data buffer.
//
// setData, getData, getSinglePlug, empty and iteration may run at the same time; iteration may or
// may not see what is inserted meanwhile. Writing a key that is present is a plain assignment: give
// each key one writer at a time and no reader meanwhile. Copying, assigning and destroying need the
// maps to themselves. Entries are never removed one by one, so a reference to a stored buffer stays
// valid until the map is assigned to or destroyed. Running out of memory raises std::bad_alloc and
// keeps what was there.
class VYRA_OPENCL_API TopenCLData {
public:
    using Key = std::pair<TuniqueString, Tplug>;

    // With h the plug's hash and n the name's: h xor (F(n) + 0x9e3779b9 + (h << 6) + (h >> 2)) in
    // 64-bit arithmetic that wraps. F is the 64-bit FNV-1a hash of the eight bytes of n, least
    // significant first; the rest is the usual combination of two hashes with the golden ratio's
    // bits.
    struct KeyHash {
        std::size_t operator()(const Key& key) const;
    };

    using Map =
        tbb::concurrent_unordered_map<Key, TopenCLDataBuffer, KeyHash, std::equal_to<Key>,
                                      tbb::tbb_allocator<std::pair<const Key, TopenCLDataBuffer>>>;
    using iterator = Map::iterator;
    using const_iterator = Map::const_iterator;

    TopenCLData();
    // Shares the memory objects of `other`; no device memory is copied.
    TopenCLData(const TopenCLData& other);
    TopenCLData& operator=(const TopenCLData& other);
    ~TopenCLData();

    // The buffer stored for the pair, or TopenCLDataBuffer::fsNULL.
    const TopenCLDataBuffer& getData(const TuniqueString& name, const Tplug& plug) const;
    // Stores a copy of `buffer` for the pair, over the one that is there.
    void setData(const TuniqueString& name, const Tplug& plug, const TopenCLDataBuffer& buffer);
    // The plug that all entries share; Tplug::fsNULL when there are several, or no entry.
    const Tplug& getSinglePlug() const;
    bool empty() const;

    // Entries in the map's own order.
    iterator begin();
    iterator end();
    const_iterator begin() const;
    const_iterator end() const;
    const_iterator cbegin() const;
    const_iterator cend() const;

    // The standard names.
    static const TuniqueString& sPositionsName();
    static const TuniqueString& sNormalsName();
    static const TuniqueString& sGeometryMatrixName();
    static const TuniqueString& sInverseGeometryMatrixName();
    static const TuniqueString& sNormalIdxToPositionIdxName();

protected:
    static const TuniqueString sfPositionsName;
    static const TuniqueString sfNormalsName;
    static const TuniqueString sfGeometryMatrixName;
    static const TuniqueString sfInverseGeometryMatrixName;
    static const TuniqueString sfNormalIdxToPositionIdxName;

private:
    Map fMap;
};
