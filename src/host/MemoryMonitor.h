// The host's account of GPU memory.
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
    // The monitor of adapter `adapter`; lives until the process ends. The library always passes 0.
    static AMemoryMonitor& MemoryMonitor(unsigned int adapter);
};

} // namespace Zyl::Objects
