// The callback for errors of the OpenCL context. Internal.
#pragma once

#include <cstddef>

#include <CL/cl.h>

// Writes `errorInfo` to the standard error stream; ignores the other arguments. The runtime may
// call it on a thread of its own.
void CL_CALLBACK contextErrorCallback(const char* errorInfo, const void* privateInfo,
                                      std::size_t privateInfoSize, void* userData);
