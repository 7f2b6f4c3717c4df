// The frame data of all kernels of a queue, in one device buffer. Internal.
#pragma once

#include "buffers/TopenCLBuffer.h"

#include <cstddef>
#include <vector>

#include <CL/cl.h>

namespace vyra {

// A buffer of the bytes that deformers pass with KernelArguments::frame. At most one command
// uploads the bytes that changed since the last evaluation. Bytes that are appended in the same
// order and sizes as before keep their place.
//
// Works with one in-order queue: an upload runs after all kernels that were enqueued before and
// read the former bytes. One object is used by one thread at a time.
class FrameBlock {
public:
    // Creates the buffer in the context of the runtime object.
    FrameBlock();
    // Waits for a pending upload.
    ~FrameBlock();
    FrameBlock(const FrameBlock&) = delete;
    FrameBlock& operator=(const FrameBlock&) = delete;

    // Starts an evaluation.
    void begin();
    // Copies the bytes. Returns the index of their first float4.
    cl_uint append(const void* bytes, std::size_t sizeInBytes);
    // Uploads the changed bytes. `event` receives the command's event if there is a command.
    // Returns an OpenCL status.
    cl_int upload(cl_command_queue queue, AutoCLObject<cl_event>& event);

    // Returns the memory that kernels read after a successful upload(); null if nothing was
    // appended. When the data grow, upload() creates another memory object; the former one is
    // released.
    cl_mem memory() const { return fDevice.buffer().get(); }

private:
    void change(std::size_t begin, std::size_t end, const void* bytes, std::size_t sizeInBytes);

    std::vector<std::byte> fHost; // the contents of the device memory after the upload
    TopenCLBuffer fDevice;
    std::size_t fEnd = 0; // of the bytes appended in this evaluation
    std::size_t fChangedBegin = 0;
    std::size_t fChangedEnd = 0; // equal to fChangedBegin: nothing changed
    bool fUploadPending = false; // an earlier upload may still read fHost
};

} // namespace vyra
