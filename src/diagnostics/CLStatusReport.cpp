#include "diagnostics/CLStatusReport.h"

#include "diagnostics/CLErrorCodes.h"
#include "diagnostics/CLInternalWarning.h"
#include "loader/OpenCLLoader.h"

void reportFailure(cl_int status, CLReportStyle style)
{
    if (status == CL_SUCCESS)
        return;
    if (style == CLReportStyle::kWithLineBreak)
        CLInternalWarning("OpenCL error: %s\n", CLErrorCodeStr(status));
    else
        CLInternalWarning("OpenCL error: %s", CLErrorCodeStr(status));
}

bool checkStatus(cl_int status, CLReportStyle style)
{
    reportFailure(status, style);
    return status == CL_SUCCESS;
}

cl_int waitForEvent(cl_event event)
{
    const cl_int status = ocl.clWaitForEvents(1, &event);
    reportFailure(status);
    return status;
}
