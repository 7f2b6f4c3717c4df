#include "viewer/DeformerKernel.h"

#include "kernels/TopenCLKernelStore.h"
#include "runtime/TopenCLInfo.h"

#include <utility>

namespace viewer {

DeformerKernel::DeformerKernel(const OpenCLFunctions& cl, const char* file, const char* name,
                               KernelFiles& files)
    : fCL(cl), fFile(file), fName(name), fKernel(files.kernel(file, name))
{
}

DeformerKernel::~DeformerKernel()
{
    TopenCLInfo::theOne().kernelStore().freeKernel(fKernel);
}

void DeformerKernel::renew(KernelFiles& files)
{
    AutoCLObject<cl_kernel> next = files.kernel(fFile, fName);
    if (!next.get())
        return;
    TopenCLInfo::theOne().kernelStore().freeKernel(fKernel);
    fKernel = std::move(next);
}

cl_int DeformerKernel::enqueue(cl_command_queue queue, std::size_t elements,
                               const AutoCLEventList& waits, AutoCLObject<cl_event>& event)
{
    std::size_t globalSize = 0;
    std::size_t localSize = 0;
    const cl_int status =
        TopenCLInfo::theOne().getWorkGroupSizes(fKernel.get(), elements, globalSize, localSize);
    if (status != CL_SUCCESS)
        return status;
    return fCL.clEnqueueNDRangeKernel(queue, fKernel.get(), 1, nullptr, &globalSize, &localSize,
                                      waits.size(), waits.array(), event.receive());
}

} // namespace viewer
