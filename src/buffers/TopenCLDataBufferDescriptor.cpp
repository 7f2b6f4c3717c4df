#include "buffers/TopenCLDataBufferDescriptor.h"

TopenCLDataBufferDescriptor::TopenCLDataBufferDescriptor()
    : fName(sfEmptyName), fPlug(Tplug::fsNULL)
{
}

TopenCLDataBufferDescriptor::TopenCLDataBufferDescriptor(
    const Tplug& plug, const TuniqueString& name, Tpermissions permissions,
    unsigned int elementSizeInBytes, unsigned int elementCount, unsigned int capacityInBytes)
    : fName(name), fPlug(plug), fElementSizeInBytes(elementSizeInBytes),
      fElementCount(elementCount), fCapacityInBytes(capacityInBytes), fPermissions(permissions)
{
}

TopenCLDataBufferDescriptor::TopenCLDataBufferDescriptor(const Tplug& plug,
                                                         const TopenCLDataBufferDescriptor& other)
    : fName(other.fName), fPlug(plug), fElementSizeInBytes(other.fElementSizeInBytes),
      fElementCount(other.fElementCount), fCapacityInBytes(other.fCapacityInBytes),
      fPermissions(other.isReadOnly() ? kReadOnly : kReadWrite)
{
}

bool TopenCLDataBufferDescriptor::hasEmptyName()
{
    return fName == sfEmptyName;
}
