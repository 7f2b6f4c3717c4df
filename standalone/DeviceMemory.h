// The device memory in use, as counted by the host.
#pragma once

#include "host/HostExport.h"

#include <cstddef>

// Bytes that the memory monitor has counted.
struct DeviceMemoryUse {
    std::size_t currentBytes = 0;
    // The maximum of currentBytes so far.
    std::size_t peakBytes = 0;
    // In use when OpenCL started.
    std::size_t offsetBytes = 0;
};

// Returns the memory in use. Safe from any thread. If other threads allocate at the same time, the
// values may be of slightly different moments.
VYRA_HOST_API DeviceMemoryUse deviceMemoryUse();
