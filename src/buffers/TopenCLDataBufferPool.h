// Device memory that is reused from evaluation to evaluation.
#pragma once

#include "VyraOpenCLExport.h"
#include "buffers/TopenCLDataBuffer.h"

#include <map>
#include <mutex>
#include <vector>

class TopenCLData;

// Hands out data buffers and takes all of them back at once. Memory is freed only with the pool.
//
// The pool keeps a copy of every buffer that it hands out, with references of its own; what the
// caller later does to its copy does not reach the pool's. The ready event that a buffer had when
// it was handed out (none, where the pool made the memory) comes along with the memory's next user.
//
// createBuffer, createOutputBuffer and releaseBuffers may be called from any thread.
// collectDataForPlug takes no lock and must not overlap with them on the same pool. OpenCL failures
// do not throw. Needs TopenCLInfo::initialize to have run.
class VYRA_OPENCL_API TopenCLDataBufferPool {
public:
    TopenCLDataBufferPool();
    // Does not wait for pending events.
    ~TopenCLDataBufferPool();
    TopenCLDataBufferPool(const TopenCLDataBufferPool&) = delete;
    TopenCLDataBufferPool& operator=(const TopenCLDataBufferPool&) = delete;

    // A buffer of at least element size times element count bytes (a 32-bit product): the free one
    // that fits best, the first of equals, else new memory of exactly that size. The buffer records
    // the size of its memory as capacity. When the memory cannot be created the result has no
    // memory: test buffer().
    TopenCLDataBuffer createBuffer(const TopenCLDataBufferDescriptor& descriptor);
    TopenCLDataBuffer createBuffer(const TopenCLDataBuffer& buffer);

    // The output of a deformer for `plug`: the memory of `input` itself where that may be written
    // (nothing is recorded then), else a writable buffer of the same name and layout from the pool.
    TopenCLDataBuffer createOutputBuffer(const TopenCLDataBuffer& input, const Tplug& plug);

    // Makes every buffer handed out so far free for reuse, though callers may still hold copies.
    void releaseBuffers();

    // Stores each handed-out buffer of `plug` in `data` under its name; the later of two wins.
    void collectDataForPlug(const Tplug& plug, TopenCLData& data) const;

private:
    // By capacity in bytes; equal ones in the order of giving back.
    using FreeBuffers = std::multimap<unsigned int, TopenCLDataBuffer>;
    struct UsedBuffer {
        TopenCLDataBuffer buffer;
        FreeBuffers::node_type place; // the entry that it will have when it is free
    };

    FreeBuffers::node_type takeBestFit(unsigned int requiredBytes, TopenCLDataBuffer& result);
    static void createMemory(unsigned int requiredBytes, TopenCLDataBuffer& result);

    FreeBuffers fFreeBuffers;
    std::vector<UsedBuffer> fUsedBuffers; // in the order of handing out
    std::mutex fMutex;                    // guards both lists
};
