#include "diagnostics/AutoCLObject.h"

#include "diagnostics/CLStatusReport.h"
#include "loader/OpenCLLoader.h"

void retainCLObject(cl_mem handle)
{
    succeeded(ocl.clRetainMemObject(handle));
}
void releaseCLObject(cl_mem handle)
{
    succeeded(ocl.clReleaseMemObject(handle));
}
void retainCLObject(cl_event handle)
{
    succeeded(ocl.clRetainEvent(handle));
}
void releaseCLObject(cl_event handle)
{
    succeeded(ocl.clReleaseEvent(handle));
}
void retainCLObject(cl_kernel handle)
{
    succeeded(ocl.clRetainKernel(handle));
}
void releaseCLObject(cl_kernel handle)
{
    succeeded(ocl.clReleaseKernel(handle));
}
void retainCLObject(cl_program handle)
{
    succeeded(ocl.clRetainProgram(handle));
}
void releaseCLObject(cl_program handle)
{
    succeeded(ocl.clReleaseProgram(handle));
}
