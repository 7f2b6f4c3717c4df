#include "viewer/InputBuffer.h"

#include "runtime/TopenCLInfo.h"

#include <cstring>

namespace viewer {

InputBuffer::InputBuffer(const TuniqueString& name, const Tplug& plug)
    : fBuffer(TopenCLInfo::theOne().openCLContext(), CL_MEM_READ_ONLY)
{
    fBuffer.openCLDataBuffer().descriptor().setName(name);
    fBuffer.openCLDataBuffer().descriptor().setPlug(plug);
}

InputBuffer::~InputBuffer()
{
    // The staging memory goes with this object. Asking for no bytes only waits.
    fBuffer.ensureBufferCapacity(0);
}

cl_int InputBuffer::writeConstant(cl_command_queue queue, const void* data, std::size_t elementSize,
                                  std::size_t count, const AutoCLEventList& waits)
{
    TopenCLDataBufferDescriptor& descriptor = fBuffer.openCLDataBuffer().descriptor();
    descriptor.setPermissions(TopenCLDataBufferDescriptor::kReadWrite);
    // A write does not change what it reads; OpenCL's own declaration says so, the buffer's does
    // not.
    const cl_int status =
        fBuffer.uploadDataToGPU(queue, CL_TRUE, 0, elementSize * count, const_cast<void*>(data),
                                waits.size(), waits.array());
    // An output that is derived from this data is to get memory of its own.
    descriptor.setPermissions(TopenCLDataBufferDescriptor::kReadOnly);
    describe(elementSize, count);
    return status;
}

cl_int InputBuffer::write(cl_command_queue queue, const void* data, std::size_t elementSize,
                          std::size_t count, const AutoCLEventList& waits)
{
    const std::size_t bytes = elementSize * count;
    // Also waits for the write of the frame before, which reads the staging memory.
    if (const cl_int status = fBuffer.ensureBufferCapacity(bytes); status != CL_SUCCESS)
        return status;
    fStaging.resize(bytes);
    std::memcpy(fStaging.data(), data, bytes);
    describe(elementSize, count);
    return fBuffer.uploadDataToGPU(queue, CL_FALSE, 0, bytes, fStaging.data(), waits.size(),
                                   waits.array());
}

void InputBuffer::describe(std::size_t elementSize, std::size_t count)
{
    TopenCLDataBufferDescriptor& descriptor = fBuffer.openCLDataBuffer().descriptor();
    descriptor.setElementSizeInBytes(static_cast<unsigned>(elementSize));
    descriptor.setElementCount(static_cast<unsigned>(count));
}

} // namespace viewer
