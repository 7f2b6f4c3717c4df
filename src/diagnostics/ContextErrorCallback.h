// What the runtime calls with an error of a context. Internal.
#pragma once

#include <cstddef>

#include <CL/cl.h>

// Writes `errorInfo` to the standard error stream; the other arguments are not looked at. May be
// called on a thread of the runtime's own.
void CL_CALLBACK contextErrorCallback(const char* errorInfo, const void* privateInfo,
                                      std::size_t privateInfoSize, void* userData);
