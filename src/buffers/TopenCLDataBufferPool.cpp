#include "buffers/TopenCLDataBufferPool.h"

#include "buffers/TopenCLBuffer.h"
#include "buffers/TopenCLData.h"
#include "runtime/TopenCLInfo.h"

#include <utility>

TopenCLDataBufferPool::TopenCLDataBufferPool() = default;
TopenCLDataBufferPool::~TopenCLDataBufferPool() = default;

TopenCLDataBuffer TopenCLDataBufferPool::createBuffer(const TopenCLDataBufferDescriptor& descriptor)
{
    const std::scoped_lock lock(fMutex);
    const unsigned int requiredBytes = descriptor.elementSizeInBytes() * descriptor.elementCount();
    TopenCLDataBuffer result(descriptor);
    // The list's room before the memory: when there is none, nothing has been taken yet.
    fUsedBuffers.emplace_back();
    if (!takeBestFit(requiredBytes, result))
        createMemory(requiredBytes, result);

    if (requiredBytes > 0 && !result.buffer().get())
        fUsedBuffers.pop_back();
    else
        fUsedBuffers.back() = result;
    return result;
}

TopenCLDataBuffer TopenCLDataBufferPool::createBuffer(const TopenCLDataBuffer& buffer)
{
    return createBuffer(buffer.descriptor());
}

// Moves the handles of the tightest free buffer into `result`, the first of equals, and takes it
// off the free list.
bool TopenCLDataBufferPool::takeBestFit(unsigned int requiredBytes, TopenCLDataBuffer& result)
{
    auto best = fFreeBuffers.end();
    unsigned int bestCapacity = 0;
    for (auto entry = fFreeBuffers.begin(); entry != fFreeBuffers.end(); ++entry) {
        const unsigned int capacity = entry->descriptor().capacityInBytes();
        if (capacity < requiredBytes || (best != fFreeBuffers.end() && capacity >= bestCapacity))
            continue;
        best = entry;
        bestCapacity = capacity;
        if (capacity == requiredBytes)
            break;
    }
    if (best == fFreeBuffers.end())
        return false;

    result.buffer() = std::move(best->buffer());
    result.bufferReadyEvent() = std::move(best->bufferReadyEvent());
    result.descriptor().setCapacityInBytes(bestCapacity);
    fFreeBuffers.erase(best);
    return true;
}

// Leaves `result` without memory when that cannot be created.
void TopenCLDataBufferPool::createMemory(unsigned int requiredBytes, TopenCLDataBuffer& result)
{
    TopenCLBuffer memory(TopenCLInfo::theOne().openCLContext(), CL_MEM_READ_WRITE);
    memory.ensureBufferCapacity(requiredBytes);
    result.setBuffer(memory.buffer(), requiredBytes);
}

TopenCLDataBuffer TopenCLDataBufferPool::createOutputBuffer(const TopenCLDataBuffer& input,
                                                            const Tplug& plug)
{
    TopenCLDataBufferDescriptor descriptor(plug, input.descriptor());
    if (!input.descriptor().isReadOnly())
        return TopenCLDataBuffer(descriptor, input.buffer(), input.bufferReadyEvent());
    descriptor.setPermissions(TopenCLDataBufferDescriptor::kReadWrite);
    return createBuffer(descriptor);
}

void TopenCLDataBufferPool::releaseBuffers()
{
    const std::scoped_lock lock(fMutex);
    fFreeBuffers.insert(fFreeBuffers.end(), fUsedBuffers.begin(), fUsedBuffers.end());
    fUsedBuffers.clear();
}

void TopenCLDataBufferPool::collectDataForPlug(const Tplug& plug, TopenCLData& data) const
{
    for (const TopenCLDataBuffer& buffer : fUsedBuffers) {
        if (buffer.descriptor().plug() == plug)
            data.setData(buffer.descriptor().name(), plug, buffer);
    }
}
