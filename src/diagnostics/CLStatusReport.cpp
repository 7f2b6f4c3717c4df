#include "diagnostics/CLStatusReport.h"

#include "diagnostics/CLErrorCodes.h"
#include "diagnostics/CLInternalWarning.h"

#include <cstdio>

bool succeeded(cl_int status, CLReportStyle style)
{
    if (status == CL_SUCCESS)
        return true;
    if (style == CLReportStyle::kSetUp)
        CLInternalWarning("OpenCL error: %s\n", CLErrorCodeStr(status));
    else
        CLInternalWarning("OpenCL error: %s", CLErrorCodeStr(status));
    return false;
}

void CL_CALLBACK contextErrorCallback(const char* errorInfo, const void* /*privateInfo*/,
                                      std::size_t /*privateInfoSize*/, void* /*userData*/)
{
    std::fprintf(stderr, "OpenCL Error: %s\n", errorInfo);
}
