// Names of OpenCL status codes.
#pragma once

#include "VyraOpenCLExport.h"

// The name of an OpenCL status code, for example "CL_OUT_OF_RESOURCES" for -5. Never null.
//
// A code that has no name gives its decimal text, which stands in a buffer of the calling thread
// and is valid until that thread's next call with such a code. Safe from any thread.
VYRA_OPENCL_API const char* CLErrorCodeStr(int code);
