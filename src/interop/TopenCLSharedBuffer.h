// A buffer that OpenCL and the viewport renderer share.
#pragma once

#include "VyraOpenCLExport.h"
#include "diagnostics/AutoCLObject.h"

#include <CL/cl.h>

// The record of one shared buffer. Its address stays valid until the record is destroyed.
struct VYRA_OPENCL_API TopenCLSharedBuffer {
    // The memory object made from the renderer's buffer. First, so that the record's address serves
    // as a list of one memory object.
    AutoCLObject<cl_mem> fMem;
    // The buffer is acquired and released with the manager's batch, not on its own.
    bool fInBatch = false;
};
