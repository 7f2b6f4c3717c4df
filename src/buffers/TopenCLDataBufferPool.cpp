#include "buffers/TopenCLDataBufferPool.h"

#include "buffers/TopenCLBuffer.h"
#include "buffers/TopenCLData.h"
#include "diagnostics/ReserveForOne.h"
#include "runtime/TopenCLInfo.h"

#include <utility>

namespace {

// Returns an entry without a buffer that is in no list.
template <typename Map>
typename Map::node_type newEntry()
{
    Map map;
    return map.extract(map.emplace());
}

} // namespace

TopenCLDataBufferPool::TopenCLDataBufferPool() = default;
TopenCLDataBufferPool::~TopenCLDataBufferPool() = default;

TopenCLDataBuffer TopenCLDataBufferPool::createBuffer(const TopenCLDataBufferDescriptor& descriptor)
{
    const std::scoped_lock lock(fMutex);
    const unsigned int requiredBytes = descriptor.elementSizeInBytes() * descriptor.elementCount();
    TopenCLDataBuffer result(descriptor);
    // The list's capacity first, so that running out of memory loses no buffer.
    reserveForOne(fUsedBuffers);
    Entry entry = takeBestFit(requiredBytes, result);
    if (entry.empty()) {
        entry = newEntry<FreeBuffers>();
        createMemory(requiredBytes, result);
    }
    if (requiredBytes == 0 || result.buffer().get()) {
        entry.mapped() = result;
        fUsedBuffers.push_back(std::move(entry));
    }
    return result;
}

TopenCLDataBuffer TopenCLDataBufferPool::createBuffer(const TopenCLDataBuffer& buffer)
{
    return createBuffer(buffer.descriptor());
}

// Moves the handles of the smallest sufficient free buffer, the first of equals, into `result` and
// removes its entry from the free list. Returns an empty entry if no buffer is large enough.
TopenCLDataBufferPool::Entry TopenCLDataBufferPool::takeBestFit(unsigned int requiredBytes,
                                                                TopenCLDataBuffer& result)
{
    const auto best = fFreeBuffers.lower_bound(requiredBytes);
    if (best == fFreeBuffers.end())
        return {};
    result.buffer() = std::move(best->second.buffer());
    result.bufferReadyEvent() = std::move(best->second.bufferReadyEvent());
    result.descriptor().setCapacityInBytes(best->first);
    return fFreeBuffers.extract(best);
}

// Creates memory for `result`, which stays without memory on failure.
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
    for (Entry& entry : fUsedBuffers) {
        entry.key() = entry.mapped().descriptor().capacityInBytes();
        fFreeBuffers.insert(std::move(entry));
    }
    fUsedBuffers.clear();
}

void TopenCLDataBufferPool::collectDataForPlug(const Tplug& plug, TopenCLData& data) const
{
    for (const Entry& entry : fUsedBuffers) {
        const TopenCLDataBuffer& buffer = entry.mapped();
        if (buffer.descriptor().plug() == plug)
            data.setData(buffer.descriptor().name(), plug, buffer);
    }
}
