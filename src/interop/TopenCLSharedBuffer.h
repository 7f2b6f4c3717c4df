// A buffer that OpenCL and the viewport renderer share.
#pragma once

#include "VyraOpenCLExport.h"
#include "diagnostics/AutoCLObject.h"

#include <CL/cl.h>

// The record of one shared buffer. Its address stays valid until the record is destroyed.
struct VYRA_OPENCL_API TopenCLSharedBuffer {
    // The memory object created from the renderer's buffer. The first member, so that the record's
    // address is also that of an array of one memory object.
    AutoCLObject<cl_mem> fMem;
    // True if the buffer is acquired and released with the manager's batch.
    bool fInBatch = false;
};
