// An input of a deformer on the device.
#pragma once

#include "buffers/TopenCLBuffer.h"
#include "diagnostics/AutoCLEventList.h"

#include <cstddef>
#include <vector>

#include <CL/cl.h>

namespace viewer {

// A device buffer that grows with the data written to it. Kernels only read it. One thread at a
// time uses an object.
class InputBuffer {
public:
    // What the data is called in a TopenCLData, and the plug that it belongs to.
    InputBuffer(const TuniqueString& name, const Tplug& plug);
    // Waits for a pending write.
    ~InputBuffer();
    InputBuffer(const InputBuffer&) = delete;
    InputBuffer& operator=(const InputBuffer&) = delete;

    // Writes data that stays for long, after `waits`, and waits until it is on the device. A status
    // of OpenCL.
    template <typename T>
    cl_int writeConstant(cl_command_queue queue, const std::vector<T>& data,
                         const AutoCLEventList& waits)
    {
        return writeConstant(queue, data.data(), sizeof(T), data.size(), waits);
    }

    // Writes the data of a frame, after `waits`, without waiting: the data is copied first, and
    // readyEvent() tells when it is on the device. A status of OpenCL.
    template <typename T>
    cl_int write(cl_command_queue queue, const T* data, std::size_t count,
                 const AutoCLEventList& waits)
    {
        return write(queue, data, sizeof(T), count, waits);
    }

    const TopenCLDataBuffer& data() const { return fBuffer.openCLDataBuffer(); }
    cl_mem memory() const { return fBuffer.buffer().get(); }
    TopenCLBuffer& buffer() { return fBuffer; }

private:
    cl_int writeConstant(cl_command_queue queue, const void* data, std::size_t elementSize,
                         std::size_t count, const AutoCLEventList& waits);
    cl_int write(cl_command_queue queue, const void* data, std::size_t elementSize,
                 std::size_t count, const AutoCLEventList& waits);
    void describe(std::size_t elementSize, std::size_t count);

    TopenCLBuffer fBuffer;
    std::vector<std::byte> fStaging; // what a pending write reads
};

} // namespace viewer
