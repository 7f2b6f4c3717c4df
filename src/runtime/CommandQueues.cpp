// Part of TopenCLInfo: queues, events and work-group sizes.
#include "diagnostics/CLStatusReport.h"
#include "loader/OpenCLLoader.h"
#include "runtime/TopenCLInfo.h"

namespace {

// The work-group size, in work-items, of a kernel for which the runtime names none.
constexpr std::size_t kDefaultWorkGroupSize = 256;

// Reads the execution status of `event`. False, reported, when it cannot be asked.
bool readExecutionStatus(cl_event event, cl_int& executionStatus)
{
    executionStatus = -1;
    return succeeded(ocl.clGetEventInfo(event, CL_EVENT_COMMAND_EXECUTION_STATUS,
                                        sizeof executionStatus, &executionStatus, nullptr));
}

} // namespace

cl_command_queue TopenCLInfo::createOpenCLCommandQueue(bool* usingOutOfOrderExecution)
{
    // Out-of-order execution is never enabled.
    if (usingOutOfOrderExecution)
        *usingOutOfOrderExecution = false;
    if (!fContext || !fDevice)
        return nullptr;

    // What the device supports makes no difference, but a device that cannot even say is not used.
    cl_command_queue_properties supported = 0;
    if (!succeeded(ocl.clGetDeviceInfo(fDevice, CL_DEVICE_QUEUE_PROPERTIES, sizeof supported,
                                       &supported, nullptr),
                   CLReportStyle::kWithLineBreak))
        return nullptr;

    cl_int status = CL_SUCCESS;
    cl_command_queue queue = ocl.clCreateCommandQueue(fContext, fDevice, 0, &status);
    if (status == CL_INVALID_VALUE || status == CL_INVALID_QUEUE_PROPERTIES)
        queue = ocl.clCreateCommandQueue(fContext, fDevice, 0, &status);
    return succeeded(status, CLReportStyle::kWithLineBreak) ? queue : nullptr;
}

void TopenCLInfo::finish()
{
    if (!isValid())
        return;
    ocl.clFinish(theOne().fCommandQueue);
    ocl.clFinish(theOne().fSecondaryCommandQueue);
}

void TopenCLInfo::flush()
{
    if (!isValid())
        return;
    ocl.clFlush(theOne().fCommandQueue);
    ocl.clFlush(theOne().fSecondaryCommandQueue);
}

bool TopenCLInfo::IsEventComplete(cl_event event)
{
    if (!event)
        return true;
    cl_int executionStatus = -1;
    if (!readExecutionStatus(event, executionStatus) || executionStatus == CL_COMPLETE)
        return true;
    // On AMD a second look decides.
    if (theOne().fProvider == kAMDProvider && !readExecutionStatus(event, executionStatus))
        return true;
    return executionStatus == CL_COMPLETE;
}

int TopenCLInfo::getWorkGroupSizes(cl_kernel kernel, std::size_t workItemCount,
                                   std::size_t& globalWorkSize, std::size_t& localWorkSize) const
{
    if (!fDevice)
        return CL_DEVICE_NOT_FOUND;
    if (!kernel)
        return CL_INVALID_KERNEL;

    std::size_t workGroupSize = 0;
    std::size_t answeredBytes = 0;
    const cl_int status =
        ocl.clGetKernelWorkGroupInfo(kernel, fDevice, CL_KERNEL_WORK_GROUP_SIZE,
                                     sizeof workGroupSize, &workGroupSize, &answeredBytes);
    if (!succeeded(status, CLReportStyle::kWithLineBreak))
        return status;

    // No runtime answers 0 for a valid kernel, but one that did would be divided by.
    localWorkSize = answeredBytes > 0 && workGroupSize > 0 ? workGroupSize : kDefaultWorkGroupSize;
    const std::size_t padded = workItemCount + localWorkSize - 1;
    globalWorkSize = padded - padded % localWorkSize;
    return CL_SUCCESS;
}
