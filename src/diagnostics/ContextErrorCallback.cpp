#include "diagnostics/ContextErrorCallback.h"

#include <cstdio>

void CL_CALLBACK contextErrorCallback(const char* errorInfo, const void* /*privateInfo*/,
                                      std::size_t /*privateInfoSize*/, void* /*userData*/)
{
    std::fprintf(stderr, "OpenCL Error: %s\n", errorInfo);
}
