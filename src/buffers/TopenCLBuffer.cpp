#include "buffers/TopenCLBuffer.h"

#include "diagnostics/CLStatusReport.h"
#include "host/MemoryMonitor.h"
#include "loader/OpenCLLoader.h"
#include "runtime/TopenCLInfo.h"

#include <limits>
#include <utility>

namespace {

Zyl::Objects::AMemoryMonitor& memoryMonitor()
{
    return Zyl::Objects::ObjModel::MemoryMonitor(0);
}

// Capacities are 32 bits wide.
bool fitsCapacity(std::size_t offset, std::size_t size)
{
    constexpr std::size_t kLargest = std::numeric_limits<unsigned int>::max();
    return offset <= kLargest && size <= kLargest - offset;
}

// Returns whether the flags require host-accessible memory and permit the host's access.
bool requiresMapping(cl_mem_flags flags)
{
    return (flags & CL_MEM_ALLOC_HOST_PTR) != 0 && (flags & CL_MEM_HOST_NO_ACCESS) == 0;
}

cl_map_flags mapFlags(cl_mem_flags flags)
{
    if ((flags & CL_MEM_HOST_WRITE_ONLY) != 0)
        return CL_MAP_WRITE;
    if ((flags & CL_MEM_HOST_READ_ONLY) != 0)
        return CL_MAP_READ;
    return 0;
}

} // namespace

TopenCLBuffer::TopenCLBuffer()
    : TopenCLBuffer(TopenCLInfo::theOne().openCLContext(), CL_MEM_READ_ONLY)
{
}

TopenCLBuffer::TopenCLBuffer(cl_context context, cl_mem_flags flags)
    : fMemFlags(flags), fContext(context)
{
}

TopenCLBuffer::TopenCLBuffer(cl_context context, cl_mem_flags flags, std::size_t size,
                             void* hostPtr, int* error)
    : TopenCLBuffer(context, flags)
{
    allocateOpenCLBuffer(size, hostPtr, error);
}

TopenCLBuffer::TopenCLBuffer(cl_context context, cl_mem_flags flags, TopenCLDataBuffer dataBuffer)
    : fDataBuffer(std::move(dataBuffer)), fMemFlags(flags), fContext(context)
{
    TopenCLDataBufferDescriptor& descriptor = fDataBuffer.descriptor();
    descriptor.setCapacityInBytes(descriptor.elementCount() * descriptor.elementSizeInBytes());
}

TopenCLBuffer::TopenCLBuffer(const TopenCLBuffer& other)
    : fDataBuffer(other.fDataBuffer), fMemFlags(other.fMemFlags), fContext(other.fContext)
{
}

TopenCLBuffer& TopenCLBuffer::operator=(const TopenCLBuffer& other)
{
    if (this == &other)
        return *this;
    reset();
    fDataBuffer = other.fDataBuffer;
    fMemFlags = other.fMemFlags;
    fContext = other.fContext;
    return *this;
}

TopenCLBuffer::~TopenCLBuffer()
{
    reset();
}

int TopenCLBuffer::ensureBufferCapacity(std::size_t bytes)
{
    if (capacityInBytes() < bytes) {
        int error = CL_SUCCESS;
        allocateOpenCLBuffer(bytes, nullptr, &error);
        return error;
    }
    AutoCLObject<cl_event>& readyEvent = bufferReadyEvent();
    if (!readyEvent.get())
        return CL_SUCCESS;
    const cl_int status = waitForEvent(readyEvent.get());
    readyEvent.reset();
    return status;
}

int TopenCLBuffer::uploadDataToGPU(cl_command_queue queue, cl_uint blocking, std::size_t offset,
                                   std::size_t size, void* hostPtr, cl_uint numEvents,
                                   const cl_event* waitList)
{
    if (size == 0)
        return CL_SUCCESS;
    if (fDataBuffer.descriptor().isReadOnly())
        return CL_INVALID_OPERATION;
    if (!fitsCapacity(offset, size))
        return CL_INVALID_BUFFER_SIZE;
    if (offset + size <= capacityInBytes())
        return enqueueWrite(queue, blocking, offset, size, hostPtr, numEvents, waitList);

    if (numEvents != 0)
        ocl.clWaitForEvents(numEvents, waitList);
    int error = CL_SUCCESS;
    if (offset == 0) {
        allocateOpenCLBuffer(size, hostPtr, &error);
        return error;
    }
    allocateOpenCLBuffer(offset + size, nullptr, &error);
    reportFailure(error);
    const cl_int status = enqueueWrite(queue, blocking, offset, size, hostPtr, numEvents, waitList);
    reportFailure(status);
    return status;
}

int TopenCLBuffer::enqueueWrite(cl_command_queue queue, cl_uint blocking, std::size_t offset,
                                std::size_t size, const void* hostPtr, cl_uint numEvents,
                                const cl_event* waitList)
{
    return ocl.clEnqueueWriteBuffer(queue, buffer().get(), blocking, offset, size, hostPtr,
                                    numEvents, waitList, bufferReadyEvent().receive());
}

int TopenCLBuffer::readBackDataFromGPU(cl_command_queue queue, cl_uint blocking, std::size_t offset,
                                       std::size_t size, void* hostPtr, cl_uint numEvents,
                                       const cl_event* waitList)
{
    return ocl.clEnqueueReadBuffer(queue, buffer().get(), blocking, offset, size, hostPtr,
                                   numEvents, numEvents != 0 ? waitList : nullptr,
                                   bufferReadyEvent().receive());
}

void TopenCLBuffer::reset()
{
    if (buffer().get() && fDeviceMemoryCounted)
        memoryMonitor().ReduceFromDeviceMemory(capacityInBytes());
    if (fMappedPointer)
        unmapMemory();
    fDeviceMemoryCounted = false;
    fDataBuffer.buffer().reset();
    bufferReadyEvent().reset();
    fDataBuffer.descriptor().setCapacityInBytes(0);
}

// Creates memory of exactly `size` bytes unless the present memory is large enough. Writes `*error`
// only if it is not.
void TopenCLBuffer::allocateOpenCLBuffer(std::size_t size, void* hostPtr, int* error)
{
    if (!fitsCapacity(0, size)) {
        *error = CL_INVALID_BUFFER_SIZE;
        return;
    }
    if (buffer().get()) {
        if (size <= capacityInBytes())
            return;
        reset();
    }
    *error = createMemory(size, hostPtr);
    if (*error == CL_SUCCESS && !hostPtr && requiresMapping(fMemFlags))
        mapMemory(size, error);
    bufferReadyEvent().reset();
}

// Counts the memory, then creates it. A creation that fails leaves no memory and no count.
int TopenCLBuffer::createMemory(std::size_t size, void* hostPtr)
{
    const unsigned int capacity = static_cast<unsigned int>(size);
    fDataBuffer.descriptor().setCapacityInBytes(capacity);
    memoryMonitor().AddToDeviceMemory(capacity);
    fDeviceMemoryCounted = true;

    const cl_mem_flags flags = hostPtr ? fMemFlags | CL_MEM_COPY_HOST_PTR : fMemFlags;
    int status = CL_SUCCESS;
    fDataBuffer.buffer().adopt(ocl.clCreateBuffer(fContext, flags, capacity, hostPtr, &status));
    if (status == CL_SUCCESS && buffer().get())
        return CL_SUCCESS;

    memoryMonitor().ReduceFromDeviceMemory(capacity);
    fDeviceMemoryCounted = false;
    fDataBuffer.buffer().reset();
    fDataBuffer.descriptor().setCapacityInBytes(0);
    // Neither a handle nor an error status is a failure, too.
    return status == CL_SUCCESS ? CL_MEM_OBJECT_ALLOCATION_FAILURE : status;
}

void TopenCLBuffer::mapMemory(std::size_t size, int* error)
{
    fMappedPointer =
        ocl.clEnqueueMapBuffer(TopenCLInfo::theOne().openCLCommandQueue(), buffer().get(), CL_TRUE,
                               mapFlags(fMemFlags), 0, size, 0, nullptr, nullptr, error);
    if (*error != CL_SUCCESS)
        fMappedPointer = nullptr;
}

void TopenCLBuffer::unmapMemory()
{
    cl_event* unmapped = bufferReadyEvent().receive();
    reportFailure(ocl.clEnqueueUnmapMemObject(TopenCLInfo::theOne().openCLCommandQueue(),
                                              buffer().get(), fMappedPointer, 0, nullptr,
                                              unmapped));
    // A failed call returns no event to wait for.
    if (*unmapped)
        waitForEvent(*unmapped);
    fMappedPointer = nullptr;
}

unsigned int TopenCLBuffer::capacityInBytes()
{
    return fDataBuffer.descriptor().capacityInBytes();
}

void* TopenCLBuffer::mappedPointer()
{
    return fMappedPointer;
}

const AutoCLObject<cl_mem>& TopenCLBuffer::buffer() const
{
    return fDataBuffer.buffer();
}

AutoCLObject<cl_event>& TopenCLBuffer::bufferReadyEvent()
{
    return fDataBuffer.bufferReadyEvent();
}

TopenCLDataBuffer& TopenCLBuffer::openCLDataBuffer()
{
    return fDataBuffer;
}

const TopenCLDataBuffer& TopenCLBuffer::openCLDataBuffer() const
{
    return fDataBuffer;
}
