// Names of OpenCL status codes.
#pragma once

#include "VyraOpenCLExport.h"

// Returns the name of an OpenCL status code, for example "CL_OUT_OF_RESOURCES" for -5. Never null.
//
// For a code without a name, returns its decimal text in a buffer of the calling thread, valid
// until that thread's next call with such a code. Safe from any thread.
VYRA_OPENCL_API const char* CLErrorCodeStr(int code);
