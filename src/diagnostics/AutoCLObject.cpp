#include "diagnostics/AutoCLObject.h"

#include "diagnostics/CLStatusReport.h"
#include "loader/OpenCLLoader.h"

void retainCLObject(cl_mem handle)
{
    reportFailure(ocl.clRetainMemObject(handle));
}
void releaseCLObject(cl_mem handle)
{
    reportFailure(ocl.clReleaseMemObject(handle));
}
void retainCLObject(cl_event handle)
{
    reportFailure(ocl.clRetainEvent(handle));
}
void releaseCLObject(cl_event handle)
{
    reportFailure(ocl.clReleaseEvent(handle));
}
void retainCLObject(cl_kernel handle)
{
    reportFailure(ocl.clRetainKernel(handle));
}
void releaseCLObject(cl_kernel handle)
{
    reportFailure(ocl.clReleaseKernel(handle));
}
void retainCLObject(cl_program handle)
{
    reportFailure(ocl.clRetainProgram(handle));
}
void releaseCLObject(cl_program handle)
{
    reportFailure(ocl.clReleaseProgram(handle));
}
