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
// may not see entries inserted during it. Writing to a key that is present is a plain assignment:
// it must not overlap with another writer or a reader of that key. Copying, assigning and
// destroying must not overlap with any other use of the maps. Single entries are never removed, so
// a reference to a stored buffer stays valid until the map is assigned to or destroyed. Throws
// std::bad_alloc when memory runs out, and then keeps its entries.
class VYRA_OPENCL_API TopenCLData {
public:
    using Key = std::pair<TuniqueString, Tplug>;

    // Returns, for the plug's hash h and the name's hash n, h xor (F(n) + 0x9e3779b9 + (h << 6) +
    // (h >> 2)) modulo 2^64. F is the 64-bit FNV-1a hash of the eight bytes of n, least significant
    // first; the rest is the usual combination of two hashes with the bits of the golden ratio.
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

    // Returns the buffer stored for the pair, or TopenCLDataBuffer::fsNULL.
    const TopenCLDataBuffer& getData(const TuniqueString& name, const Tplug& plug) const;
    // Stores a copy of `buffer` for the pair, in place of the present one.
    void setData(const TuniqueString& name, const Tplug& plug, const TopenCLDataBuffer& buffer);
    // Returns the plug of all entries; Tplug::fsNULL if they have several, or there is no entry.
    const Tplug& getSinglePlug() const;
    bool empty() const;

    // Iterate over the entries in the map's order.
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
