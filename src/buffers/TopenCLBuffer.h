// A device buffer that grows on demand.
#pragma once

#include "VyraOpenCLExport.h"
#include "buffers/TopenCLDataBuffer.h"

#include <cstddef>

#include <CL/cl.h>

// One OpenCL memory object with its last transfer's event, upload, read-back and, where its flags
// ask for it, a host mapping that lives as long as the memory.
//
// Growing makes a new memory object of exactly the size asked for; the old contents are not kept.
// Memory that this object makes is counted in the host's memory monitor. Sizes and offsets are
// bytes; capacities are 32 bits wide, and a size that does not fit them is refused with
// CL_INVALID_BUFFER_SIZE (-61), nothing changed. Status results are OpenCL's, CL_SUCCESS (0) for
// success; nothing throws.
//
// A mapping is made for memory created without host data, with CL_MEM_ALLOC_HOST_PTR and without
// CL_MEM_HOST_NO_ACCESS: for writing with CL_MEM_HOST_WRITE_ONLY, else for reading with
// CL_MEM_HOST_READ_ONLY, else with no map flag.
//
// One object is used by one thread at a time. The default constructor and the mapping need
// TopenCLInfo::initialize to have run.
class VYRA_OPENCL_API TopenCLBuffer {
public:
    // In the runtime's context, CL_MEM_READ_ONLY. Creates no memory.
    TopenCLBuffer();
    // `context` is borrowed. Creates no memory.
    TopenCLBuffer(cl_context context, cl_mem_flags flags);
    // Creates `size` bytes at once, holding the bytes at `hostPtr` unless that is null. `*error`,
    // which must not be null, receives the status.
    TopenCLBuffer(cl_context context, cl_mem_flags flags, std::size_t size, void* hostPtr,
                  int* error);
    // Shares the memory and the event of `dataBuffer`. The capacity is its element count times its
    // element size, whatever capacity it records; the memory is not counted in the monitor.
    TopenCLBuffer(cl_context context, cl_mem_flags flags, TopenCLDataBuffer dataBuffer);

    // A copy shares the memory object and the event. The mapping and the count stay with the
    // original, which alone unmaps and un-counts.
    TopenCLBuffer(const TopenCLBuffer& other);
    // Resets this buffer first, save for self-assignment.
    TopenCLBuffer& operator=(const TopenCLBuffer& other);
    ~TopenCLBuffer();

    // Makes the buffer hold at least `bytes` with no transfer pending: creates memory when it is
    // too small, else waits for the last transfer and drops its event. Returns the status of the
    // creation (and of the mapping) or of the wait. Wraps clCreateBuffer, clEnqueueMapBuffer,
    // clWaitForEvents.
    int ensureBufferCapacity(std::size_t bytes);

    // Writes `size` bytes from `hostPtr` at `offset`, after the events of `waitList`; the write's
    // event becomes the ready event. The buffer's own former ready event is released before the
    // write is enqueued: if `waitList` has it, another holder must keep it alive. A buffer that is
    // too small waits for `waitList` and grows first: at offset 0 the memory is created with the
    // data in it and no event remains; at another offset the bytes before it are undefined. 0 bytes
    // are always fine; otherwise a read-only buffer gives CL_INVALID_OPERATION (-59). Wraps
    // clEnqueueWriteBuffer.
    int uploadDataToGPU(cl_command_queue queue, cl_uint blocking, std::size_t offset,
                        std::size_t size, void* hostPtr, cl_uint numEvents,
                        const cl_event* waitList);

    // Reads `size` bytes at `offset` into `hostPtr`, after the events of `waitList`; the read's
    // event becomes the ready event. The former ready event is released first, as in
    // uploadDataToGPU. Neither capacity nor permissions are checked. Wraps clEnqueueReadBuffer.
    int readBackDataFromGPU(cl_command_queue queue, cl_uint blocking, std::size_t offset,
                            std::size_t size, void* hostPtr, cl_uint numEvents,
                            const cl_event* waitList);

    // Unmaps (waiting for it), takes the memory out of the monitor, releases memory and event.
    void reset();

    unsigned int capacityInBytes();
    // The mapping of the whole buffer, or null. Valid until the memory is replaced.
    void* mappedPointer();
    const AutoCLObject<cl_mem>& buffer() const;
    // The event of the last transfer, or an empty holder.
    AutoCLObject<cl_event>& bufferReadyEvent();
    TopenCLDataBuffer& openCLDataBuffer();
    const TopenCLDataBuffer& openCLDataBuffer() const;

private:
    void allocateOpenCLBuffer(std::size_t size, void* hostPtr, int* error);
    int createMemory(std::size_t size, void* hostPtr);
    void mapMemory(std::size_t size, int* error);
    void unmapMemory();
    int enqueueWrite(cl_command_queue queue, cl_uint blocking, std::size_t offset, std::size_t size,
                     const void* hostPtr, cl_uint numEvents, const cl_event* waitList);

    TopenCLDataBuffer fDataBuffer;
    void* fMappedPointer = nullptr;
    cl_mem_flags fMemFlags = CL_MEM_READ_ONLY;
    cl_context fContext = nullptr; // borrowed
    bool fDeviceMemoryCounted = false;
};
