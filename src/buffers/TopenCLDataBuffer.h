// A piece of a deformer's data on the device.
#pragma once

#include "VyraOpenCLExport.h"
#include "buffers/TopenCLDataBufferDescriptor.h"
#include "diagnostics/AutoCLObject.h"

// One memory object, the event that says when its contents are ready, and what it holds.
//
// Copies share the memory object and the event, each with references of its own; the last one to go
// releases them. A plain value: one object is not written by one thread while another uses it,
// distinct copies may be used on different threads. A retain or release that fails is reported as a
// warning, and the value changes all the same.
class VYRA_OPENCL_API TopenCLDataBuffer {
public:
    // Empty handles and a default descriptor: what look-ups return when they find nothing.
    static const TopenCLDataBuffer fsNULL;

    TopenCLDataBuffer();
    TopenCLDataBuffer(const TopenCLDataBufferDescriptor& descriptor);
    // Shares both handles; the descriptor is taken whole, its capacity included.
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
    // Exchanges the handles: the former ones of this object are released with `other`.
    TopenCLDataBuffer& operator=(TopenCLDataBuffer&& other) noexcept;
    ~TopenCLDataBuffer();

    AutoCLObject<cl_mem>& buffer() { return fBuffer; }
    const AutoCLObject<cl_mem>& buffer() const { return fBuffer; }
    AutoCLObject<cl_event>& bufferReadyEvent() { return fBufferReadyEvent; }
    const AutoCLObject<cl_event>& bufferReadyEvent() const { return fBufferReadyEvent; }
    TopenCLDataBufferDescriptor& descriptor() { return fDescriptor; }
    const TopenCLDataBufferDescriptor& descriptor() const { return fDescriptor; }

    // Shares `buffer` and records its size in bytes.
    void setBuffer(const AutoCLObject<cl_mem>& buffer, unsigned int capacityInBytes);
    void setBufferReadyEvent(const AutoCLObject<cl_event>& readyEvent);

    // Equality is identity of the data, not of the memory: equal names and equal plugs.
    bool operator==(const TopenCLDataBuffer& other) const;
    bool operator!=(const TopenCLDataBuffer& other) const;

private:
    AutoCLObject<cl_mem> fBuffer;
    AutoCLObject<cl_event> fBufferReadyEvent;
    TopenCLDataBufferDescriptor fDescriptor;
};
