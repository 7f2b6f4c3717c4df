// Part of TopenCLInfo: queues, events and work-group sizes.
#include "diagnostics/CLStatusReport.h"
#include "loader/OpenCLLoader.h"
#include "runtime/TopenCLInfo.h"

#include <optional>

namespace {

// The work-group size, in work-items, if the runtime reports none.
constexpr std::size_t kDefaultWorkGroupSize = 256;

// Returns the execution status of the command of `event`. Empty if the query fails, which is
// reported.
std::optional<cl_int> executionStatusOf(cl_event event)
{
    cl_int status = -1;
    if (!checkStatus(ocl.clGetEventInfo(event, CL_EVENT_COMMAND_EXECUTION_STATUS, sizeof status,
                                        &status, nullptr)))
        return std::nullopt;
    return status;
}

} // namespace

cl_command_queue TopenCLInfo::createOpenCLCommandQueue(bool* usingOutOfOrderExecution)
{
    // Out-of-order execution is never enabled.
    if (usingOutOfOrderExecution)
        *usingOutOfOrderExecution = false;
    if (!fContext || !fDevice)
        return nullptr;

    // The answer makes no difference, but a device that fails the query gets no queue.
    cl_command_queue_properties supported = 0;
    if (!checkStatus(ocl.clGetDeviceInfo(fDevice, CL_DEVICE_QUEUE_PROPERTIES, sizeof supported,
                                         &supported, nullptr),
                     CLReportStyle::kWithLineBreak))
        return nullptr;

    cl_int status = CL_SUCCESS;
    cl_command_queue queue = ocl.clCreateCommandQueue(fContext, fDevice, 0, &status);
    if (status == CL_INVALID_VALUE || status == CL_INVALID_QUEUE_PROPERTIES)
        queue = ocl.clCreateCommandQueue(fContext, fDevice, 0, &status);
    return checkStatus(status, CLReportStyle::kWithLineBreak) ? queue : nullptr;
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
    std::optional<cl_int> status = executionStatusOf(event);
    // On AMD a second query decides.
    if (status && *status != CL_COMPLETE && theOne().fProvider == kAMDProvider)
        status = executionStatusOf(event);
    return status.value_or(CL_COMPLETE) == CL_COMPLETE;
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
    if (!checkStatus(status, CLReportStyle::kWithLineBreak))
        return status;

    // 0 is not a valid answer, and the size is a divisor.
    localWorkSize = answeredBytes > 0 && workGroupSize > 0 ? workGroupSize : kDefaultWorkGroupSize;
    const std::size_t padded = workItemCount + localWorkSize - 1;
    globalWorkSize = padded - padded % localWorkSize;
    return CL_SUCCESS;
}
