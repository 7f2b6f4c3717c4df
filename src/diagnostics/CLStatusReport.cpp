#include "diagnostics/CLStatusReport.h"

#include "diagnostics/CLErrorCodes.h"
#include "diagnostics/CLInternalWarning.h"
#include "loader/OpenCLLoader.h"

namespace {

constinit thread_local cl_int sfReportedStatus = CL_SUCCESS;

// Not inlined, to keep the path of a success short.
[[gnu::noinline]] void report(cl_int status, CLReportStyle style)
{
    sfReportedStatus = status;
    if (style == CLReportStyle::kWithLineBreak)
        CLInternalWarning("OpenCL error: %s\n", CLErrorCodeStr(status));
    else
        CLInternalWarning("OpenCL error: %s", CLErrorCodeStr(status));
    sfReportedStatus = CL_SUCCESS;
}

} // namespace

cl_int reportedStatus() noexcept
{
    return sfReportedStatus;
}

void reportFailure(cl_int status, CLReportStyle style)
{
    if (status != CL_SUCCESS)
        report(status, style);
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
