#include "buffers/TopenCLDataBuffer.h"

TopenCLDataBuffer::TopenCLDataBuffer() = default;

TopenCLDataBuffer::TopenCLDataBuffer(const TopenCLDataBufferDescriptor& descriptor)
    : fDescriptor(descriptor)
{
}

TopenCLDataBuffer::TopenCLDataBuffer(const TopenCLDataBufferDescriptor& descriptor,
                                     const AutoCLObject<cl_mem>& buffer,
                                     const AutoCLObject<cl_event>& readyEvent)
    : fBuffer(buffer), fBufferReadyEvent(readyEvent), fDescriptor(descriptor)
{
}

TopenCLDataBuffer::TopenCLDataBuffer(const Tplug& plug, const TuniqueString& name,
                                     TopenCLDataBufferDescriptor::Tpermissions permissions,
                                     unsigned int elementSizeInBytes, unsigned int elementCount,
                                     unsigned int capacityInBytes)
    : fDescriptor(plug, name, permissions, elementSizeInBytes, elementCount, capacityInBytes)
{
}

TopenCLDataBuffer::TopenCLDataBuffer(const TopenCLDataBuffer& other) = default;
TopenCLDataBuffer::TopenCLDataBuffer(TopenCLDataBuffer&& other) noexcept = default;
TopenCLDataBuffer& TopenCLDataBuffer::operator=(const TopenCLDataBuffer& other) = default;
TopenCLDataBuffer& TopenCLDataBuffer::operator=(TopenCLDataBuffer&& other) noexcept = default;
TopenCLDataBuffer::~TopenCLDataBuffer() = default;

void TopenCLDataBuffer::setBuffer(const AutoCLObject<cl_mem>& buffer, unsigned int capacityInBytes)
{
    fBuffer = buffer;
    fDescriptor.setCapacityInBytes(capacityInBytes);
}

void TopenCLDataBuffer::setBufferReadyEvent(const AutoCLObject<cl_event>& readyEvent)
{
    fBufferReadyEvent = readyEvent;
}

bool TopenCLDataBuffer::operator==(const TopenCLDataBuffer& other) const
{
    return fDescriptor.name() == other.fDescriptor.name() &&
           fDescriptor.plug() == other.fDescriptor.plug();
}

bool TopenCLDataBuffer::operator!=(const TopenCLDataBuffer& other) const
{
    return !(*this == other);
}
