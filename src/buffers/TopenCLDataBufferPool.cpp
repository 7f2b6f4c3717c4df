#include "buffers/TopenCLDataBufferPool.h"

#include "buffers/TopenCLBuffer.h"
#include "buffers/TopenCLData.h"
#include "runtime/TopenCLInfo.h"

#include <utility>

namespace {

// An entry without a buffer, not in any list yet.
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
    // The lists' room before the memory: when there is none, nothing has been taken yet.
    if (fUsedBuffers.size() == fUsedBuffers.capacity())
        fUsedBuffers.reserve(2 * fUsedBuffers.size() + 1);
    FreeBuffers::node_type place = takeBestFit(requiredBytes, result);
    if (place.empty()) {
        place = newEntry<FreeBuffers>();
        createMemory(requiredBytes, result);
    }
    if (requiredBytes == 0 || result.buffer().get())
        fUsedBuffers.push_back({result, std::move(place)});
    return result;
}

TopenCLDataBuffer TopenCLDataBufferPool::createBuffer(const TopenCLDataBuffer& buffer)
{
    return createBuffer(buffer.descriptor());
}

// Moves the handles of the tightest free buffer into `result`, the first of equals, and takes its
// entry off the free list. No entry when no buffer is large enough.
TopenCLDataBufferPool::FreeBuffers::node_type
TopenCLDataBufferPool::takeBestFit(unsigned int requiredBytes, TopenCLDataBuffer& result)
{
    const auto best = fFreeBuffers.lower_bound(requiredBytes);
    if (best == fFreeBuffers.end())
        return {};
    result.buffer() = std::move(best->second.buffer());
    result.bufferReadyEvent() = std::move(best->second.bufferReadyEvent());
    result.descriptor().setCapacityInBytes(best->first);
    return fFreeBuffers.extract(best);
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
    for (auto& [buffer, place] : fUsedBuffers) {
        place.key() = buffer.descriptor().capacityInBytes();
        place.mapped() = buffer;
        fFreeBuffers.insert(std::move(place));
    }
    fUsedBuffers.clear();
}

void TopenCLDataBufferPool::collectDataForPlug(const Tplug& plug, TopenCLData& data) const
{
    for (const auto& [buffer, place] : fUsedBuffers) {
        if (buffer.descriptor().plug() == plug)
            data.setData(buffer.descriptor().name(), plug, buffer);
    }
}
