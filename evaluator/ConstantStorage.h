// The host bytes and the device memory that copies of a ConstantArray share. Internal.
#pragma once

#include "buffers/TopenCLBuffer.h"

#include <atomic>
#include <cstddef>
#include <mutex>
#include <optional>
#include <vector>

#include <CL/cl.h>

namespace vyra {

class ConstantStorage {
public:
    ConstantStorage(const void* bytes, std::size_t sizeInBytes);

    const std::vector<std::byte>& bytes() const noexcept { return fBytes; }

    // Returns the device memory; the first successful call creates it with the bytes as contents.
    // On failure returns null. `status` receives the status. Safe from any thread.
    cl_mem memory(cl_int& status);

private:
    std::vector<std::byte> fBytes;
    std::mutex fCreation; // guards fBuffer
    std::optional<TopenCLBuffer> fBuffer;
    std::atomic<cl_mem> fMemory = nullptr; // of fBuffer
};

} // namespace vyra
