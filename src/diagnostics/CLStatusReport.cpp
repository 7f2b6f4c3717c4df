#include "diagnostics/CLStatusReport.h"

#include "diagnostics/CLErrorCodes.h"
#include "diagnostics/CLInternalWarning.h"

void reportFailure(cl_int status, CLReportStyle style)
{
    if (status == CL_SUCCESS)
        return;
    if (style == CLReportStyle::kWithLineBreak)
        CLInternalWarning("OpenCL error: %s\n", CLErrorCodeStr(status));
    else
        CLInternalWarning("OpenCL error: %s", CLErrorCodeStr(status));
}

bool succeeded(cl_int status, CLReportStyle style)
{
    reportFailure(status, style);
    return status == CL_SUCCESS;
}
