// The host's accounting of GPU memory.
#pragma once

#include "host/HostExport.h"

#include <cstddef>

namespace Zyl::Objects {

// Safe from any thread. Sizes are bytes.
class VYRA_HOST_API AMemoryMonitor {
public:
    virtual ~AMemoryMonitor();
    virtual void AddToDeviceMemory(std::size_t size) = 0;
    virtual void ReduceFromDeviceMemory(std::size_t size) = 0;
};

class VYRA_HOST_API ObjModel {
public:
    // Returns the monitor of `adapter`, which lives until the process ends. The library passes 0.
    static AMemoryMonitor& MemoryMonitor(unsigned int adapter);
};

} // namespace Zyl::Objects
