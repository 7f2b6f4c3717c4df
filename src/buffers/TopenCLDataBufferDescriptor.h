// The description of a data buffer.
#pragma once

#include "VyraOpenCLExport.h"
#include "host/Tplug.h"
#include "host/TuniqueString.h"

// The name of the data in a device buffer, the plug that it belongs to, count and size of its
// elements, the size of the memory, and whether the memory may be written.
//
//     |<------------------ capacityInBytes ------------------->|
//     | element 0 | element 1 | ... | element count-1 |  slack  |
//     |<- size -->|
//
// The requested bytes are element size times element count, a 32-bit product; the capacity is
// recorded separately and may differ. A value: one object must not be written by one thread while
// another uses it.
class VYRA_OPENCL_API TopenCLDataBufferDescriptor {
public:
    // Any value may be stored: 0 is read-only, all others are read-write.
    enum Tpermissions : int {
        kReadOnly = 0,
        kReadWrite = 1,
    };

    // Sets the empty name, the null plug, sizes of 0, read-write.
    TopenCLDataBufferDescriptor();

    // Sizes and capacity in bytes.
    TopenCLDataBufferDescriptor(const Tplug& plug, const TuniqueString& name,
                                Tpermissions permissions, unsigned int elementSizeInBytes,
                                unsigned int elementCount, unsigned int capacityInBytes);

    // Describes an output derived from `other`: copies its name and layout, sets the output's plug,
    // and sets the permissions to kReadOnly or kReadWrite as isReadOnly() reports.
    TopenCLDataBufferDescriptor(const Tplug& plug, const TopenCLDataBufferDescriptor& other);

    const TuniqueString& name() const noexcept { return fName; }
    const Tplug& plug() const noexcept { return fPlug; }
    unsigned int elementSizeInBytes() const noexcept { return fElementSizeInBytes; }
    unsigned int elementCount() const noexcept { return fElementCount; }
    unsigned int capacityInBytes() const noexcept { return fCapacityInBytes; }
    bool isReadOnly() const noexcept { return fPermissions == kReadOnly; }
    bool hasEmptyName();

    // Each stores its argument unchanged.
    void setName(const TuniqueString& name) { fName = name; }
    void setPlug(const Tplug& plug) { fPlug = plug; }
    void setPermissions(Tpermissions permissions) { fPermissions = permissions; }
    void setElementSizeInBytes(unsigned int size) { fElementSizeInBytes = size; }
    void setElementCount(unsigned int count) { fElementCount = count; }
    void setCapacityInBytes(unsigned int capacity) { fCapacityInBytes = capacity; }

private:
    static const TuniqueString sfEmptyName;

    TuniqueString fName;
    Tplug fPlug;
    unsigned int fElementSizeInBytes = 0;
    unsigned int fElementCount = 0;
    unsigned int fCapacityInBytes = 0;
    Tpermissions fPermissions = kReadWrite;
};
