// A device buffer that grows on demand.
#pragma once

#include "VyraOpenCLExport.h"
#include "buffers/TopenCLDataBuffer.h"

#include <cstddef>

#include <CL/cl.h>

// One OpenCL memory object with the event of its last transfer and, if its flags require it, a host
// mapping that exists as long as the memory.
//
// Growing creates a memory object of exactly the requested size and discards the contents. Memory
// created by this object is counted in the host's memory monitor. Sizes and offsets are bytes.
// Capacities have 32 bits: a larger size returns CL_INVALID_BUFFER_SIZE (-61) and changes nothing.
// Status results are OpenCL's, CL_SUCCESS (0) on success; nothing throws.
//
// Memory is mapped if it is created without host data, with CL_MEM_ALLOC_HOST_PTR and without
// CL_MEM_HOST_NO_ACCESS: for writing with CL_MEM_HOST_WRITE_ONLY, else for reading with
// CL_MEM_HOST_READ_ONLY, else with no map flag.
//
// One object is used by one thread at a time. The default constructor and the mapping require
// TopenCLInfo::initialize.
class VYRA_OPENCL_API TopenCLBuffer {
public:
    // Uses the runtime's context and CL_MEM_READ_ONLY. Creates no memory.
    TopenCLBuffer();
    // `context` is borrowed. Creates no memory.
    TopenCLBuffer(cl_context context, cl_mem_flags flags);
    // Creates memory of `size` bytes, with a copy of the bytes at `hostPtr` unless that is null.
    // `*error` receives the status; `error` must not be null.
    TopenCLBuffer(cl_context context, cl_mem_flags flags, std::size_t size, void* hostPtr,
                  int* error);
    // Shares the memory and the event of `dataBuffer`. The capacity is its element count times its
    // element size; its recorded capacity is ignored. The memory is not counted in the monitor.
    TopenCLBuffer(cl_context context, cl_mem_flags flags, TopenCLDataBuffer dataBuffer);

    // Shares the memory object and the event. The mapping and the count stay with `other`, which
    // alone unmaps the memory and removes it from the monitor.
    TopenCLBuffer(const TopenCLBuffer& other);
    // Resets this buffer first. Self-assignment does nothing.
    TopenCLBuffer& operator=(const TopenCLBuffer& other);
    ~TopenCLBuffer();

    // Ensures a capacity of at least `bytes` and no pending transfer: creates memory if the buffer
    // is too small, else waits for the last transfer and releases its event. Returns the status of
    // the creation (and of the mapping) or of the wait. Wraps clCreateBuffer, clEnqueueMapBuffer,
    // clWaitForEvents.
    int ensureBufferCapacity(std::size_t bytes);

    // Writes `size` bytes from `hostPtr` at `offset`, after the events of `waitList`; the write's
    // event becomes the ready event. The buffer's previous ready event is released before the write
    // is enqueued: if `waitList` has it, another holder must keep it alive. A buffer that is too
    // small waits for `waitList` and grows first: at offset 0 the memory is created with the data
    // and no event remains; at another offset the bytes before it are undefined. Returns CL_SUCCESS
    // for 0 bytes, and otherwise CL_INVALID_OPERATION (-59) for a read-only buffer. Wraps
    // clEnqueueWriteBuffer.
    int uploadDataToGPU(cl_command_queue queue, cl_uint blocking, std::size_t offset,
                        std::size_t size, void* hostPtr, cl_uint numEvents,
                        const cl_event* waitList);

    // Reads `size` bytes at `offset` into `hostPtr`, after the events of `waitList`; the read's
    // event becomes the ready event. The previous ready event is released first, as in
    // uploadDataToGPU. Neither capacity nor permissions are checked. Wraps clEnqueueReadBuffer.
    int readBackDataFromGPU(cl_command_queue queue, cl_uint blocking, std::size_t offset,
                            std::size_t size, void* hostPtr, cl_uint numEvents,
                            const cl_event* waitList);

    // Unmaps the memory and waits for that, removes it from the monitor, releases memory and event.
    void reset();

    unsigned int capacityInBytes();
    // Returns the address of the mapped buffer, or null. Valid until the memory is replaced.
    void* mappedPointer();
    const AutoCLObject<cl_mem>& buffer() const;
    // Returns the event of the last transfer, or an empty holder.
    AutoCLObject<cl_event>& bufferReadyEvent();
    TopenCLDataBuffer& openCLDataBuffer();
    const TopenCLDataBuffer& openCLDataBuffer() const;

private:
    void allocateOpenCLBuffer(std::size_t size, void* hostPtr, int* error);
    [[nodiscard]] int createMemory(std::size_t size, void* hostPtr);
    void mapMemory(std::size_t size, int* error);
    void unmapMemory();
    [[nodiscard]] int enqueueWrite(cl_command_queue queue, cl_uint blocking, std::size_t offset,
                                   std::size_t size, const void* hostPtr, cl_uint numEvents,
                                   const cl_event* waitList);

    TopenCLDataBuffer fDataBuffer;
    void* fMappedPointer = nullptr;
    cl_mem_flags fMemFlags = CL_MEM_READ_ONLY;
    cl_context fContext = nullptr; // borrowed
    bool fDeviceMemoryCounted = false;
};
