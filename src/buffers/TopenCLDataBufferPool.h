// A pool of device memory for evaluations.
#pragma once

#include "VyraOpenCLExport.h"
#include "buffers/TopenCLDataBuffer.h"

#include <map>
#include <mutex>
#include <vector>

class TopenCLData;

// A pool that returns data buffers and reclaims all of them in one call. Memory is released only by
// the pool's destructor.
//
// The pool keeps a copy of every buffer that it returns, with references of its own: changes to the
// caller's copy do not change the pool's. The next user of the memory receives it with the ready
// event that it had when it was returned last; new memory has none.
//
// createBuffer, createOutputBuffer and releaseBuffers may be called from any thread.
// collectDataForPlug takes no lock and must not overlap with them on the same pool. OpenCL failures
// do not throw. Requires TopenCLInfo::initialize.
class VYRA_OPENCL_API TopenCLDataBufferPool {
public:
    TopenCLDataBufferPool();
    // Does not wait for pending events.
    ~TopenCLDataBufferPool();
    TopenCLDataBufferPool(const TopenCLDataBufferPool&) = delete;
    TopenCLDataBufferPool& operator=(const TopenCLDataBufferPool&) = delete;

    // Returns a buffer of at least element size times element count bytes (a 32-bit product): the
    // smallest free one that is large enough, the first of equals, else new memory of exactly that
    // size. Its capacity is the size of the memory. If the memory cannot be created, buffer() of
    // the result is empty.
    TopenCLDataBuffer createBuffer(const TopenCLDataBufferDescriptor& descriptor);
    TopenCLDataBuffer createBuffer(const TopenCLDataBuffer& buffer);

    // Returns the output of a deformer for `plug`: the memory of `input` if that may be written
    // (the pool keeps no copy then), else a writable buffer of the same name and layout from the
    // pool.
    TopenCLDataBuffer createOutputBuffer(const TopenCLDataBuffer& input, const Tplug& plug);

    // Makes every buffer returned so far free for reuse, even if callers still hold copies.
    void releaseBuffers();

    // Stores each buffer in use of `plug` in `data` under its name. Of two with one name the later
    // is stored.
    void collectDataForPlug(const Tplug& plug, TopenCLData& data) const;

private:
    // By capacity in bytes; equal ones in the order of their release.
    using FreeBuffers = std::multimap<unsigned int, TopenCLDataBuffer>;
    using Entry = FreeBuffers::node_type;

    [[nodiscard]] Entry takeBestFit(unsigned int requiredBytes, TopenCLDataBuffer& result);
    static void createMemory(unsigned int requiredBytes, TopenCLDataBuffer& result);

    FreeBuffers fFreeBuffers;
    std::vector<Entry> fUsedBuffers; // in the order of creation
    std::mutex fMutex;               // guards both lists
};
