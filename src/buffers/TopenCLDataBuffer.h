// Data of a deformer on the device.
#pragma once

#include "VyraOpenCLExport.h"
#include "buffers/TopenCLDataBufferDescriptor.h"
#include "diagnostics/AutoCLObject.h"

// One memory object, the event that signals that its contents are ready, and their description.
//
// A value: copies share the memory object and the event, each with references of its own. One
// object must not be written by one thread while another uses it; different copies may be used on
// different threads. A retain or release that fails is reported as a warning; the value changes as
// if it had succeeded.
class VYRA_OPENCL_API TopenCLDataBuffer {
public:
    // Has empty handles and a default descriptor. The result of look-ups that find nothing.
    static const TopenCLDataBuffer fsNULL;

    TopenCLDataBuffer();
    TopenCLDataBuffer(const TopenCLDataBufferDescriptor& descriptor);
    // Shares both handles and copies the descriptor with its capacity.
    TopenCLDataBuffer(const TopenCLDataBufferDescriptor& descriptor,
                      const AutoCLObject<cl_mem>& buffer, const AutoCLObject<cl_event>& readyEvent);
    TopenCLDataBuffer(const Tplug& plug, const TuniqueString& name,
                      TopenCLDataBufferDescriptor::Tpermissions permissions,
                      unsigned int elementSizeInBytes, unsigned int elementCount,
                      unsigned int capacityInBytes);

    TopenCLDataBuffer(const TopenCLDataBuffer& other);
    // Leaves `other` without handles.
    TopenCLDataBuffer(TopenCLDataBuffer&& other) noexcept;
    TopenCLDataBuffer& operator=(const TopenCLDataBuffer& other);
    // Exchanges the handles: the previous ones of this object are released by `other`.
    TopenCLDataBuffer& operator=(TopenCLDataBuffer&& other) noexcept;
    ~TopenCLDataBuffer();

    AutoCLObject<cl_mem>& buffer() noexcept { return fBuffer; }
    const AutoCLObject<cl_mem>& buffer() const noexcept { return fBuffer; }
    AutoCLObject<cl_event>& bufferReadyEvent() noexcept { return fBufferReadyEvent; }
    const AutoCLObject<cl_event>& bufferReadyEvent() const noexcept { return fBufferReadyEvent; }
    TopenCLDataBufferDescriptor& descriptor() noexcept { return fDescriptor; }
    const TopenCLDataBufferDescriptor& descriptor() const noexcept { return fDescriptor; }

    // Shares `buffer` and records its size in bytes.
    void setBuffer(const AutoCLObject<cl_mem>& buffer, unsigned int capacityInBytes);
    void setBufferReadyEvent(const AutoCLObject<cl_event>& readyEvent);

    // Compare name and plug only, not the memory.
    bool operator==(const TopenCLDataBuffer& other) const;
    bool operator!=(const TopenCLDataBuffer& other) const;

private:
    AutoCLObject<cl_mem> fBuffer;
    AutoCLObject<cl_event> fBufferReadyEvent;
    TopenCLDataBufferDescriptor fDescriptor;
};
