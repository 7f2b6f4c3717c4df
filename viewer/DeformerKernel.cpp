#include "viewer/DeformerKernel.h"

#include "kernels/TopenCLKernelStore.h"
#include "runtime/TopenCLInfo.h"

namespace viewer {

DeformerKernel::DeformerKernel(const OpenCLFunctions& cl, const char* file, const char* name,
                               KernelCounts& counts)
    : fCL(cl)
{
    TopenCLInfo& info = TopenCLInfo::theOne();
    Tstring path = info.getAbsolutePathToResources();
    path += "/kernels/";
    path += file;
    fKernel = info.kernelStore().getKernel(path.asChar(), nullptr, name, nullptr);
    if (!valid())
        return;
    counts.served += 1;
    counts.programs.insert(file);
}

DeformerKernel::~DeformerKernel()
{
    TopenCLInfo::theOne().kernelStore().freeKernel(fKernel);
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
