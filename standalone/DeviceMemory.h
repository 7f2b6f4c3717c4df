// What the host knows of the device memory in use.
#pragma once

#include "host/HostExport.h"

#include <cstddef>

// All values are bytes, as the memory monitor was told.
struct DeviceMemoryUse {
    std::size_t currentBytes = 0;
    // The most that was ever in use at once.
    std::size_t peakBytes = 0;
    // In use already when OpenCL came up.
    std::size_t offsetBytes = 0;
};

// Safe from any thread. While others allocate, the values may be of slightly different moments.
VYRA_HOST_API DeviceMemoryUse deviceMemoryUse();
