#include "DirectKernel.h"

#include "diagnostics/CLErrorCodes.h"
#include "evaluator/Evaluator.h"
#include "evaluator/KernelBuild.h"
#include "host/TstringArray.h"
#include "kernels/TopenCLKernelStore.h"
#include "runtime/TopenCLInfo.h"

#include <algorithm>
#include <cstring>
#include <stdexcept>
#include <string>

namespace {

AutoCLObject<cl_mem> createMemory(cl_mem_flags flags, std::size_t size, const void* contents)
{
    cl_int status = CL_SUCCESS;
    AutoCLObject<cl_mem> memory;
    memory.adopt(clCreateBuffer(TopenCLInfo::theOne().openCLContext(), flags, size,
                                const_cast<void*>(contents), &status));
    requireSuccess(status);
    return memory;
}

} // namespace

void requireSuccess(cl_int status)
{
    if (status != CL_SUCCESS)
        throw std::runtime_error(std::string("OpenCL failed: ") + CLErrorCodeStr(status));
}

cl_mem ConstantCopies::copyOf(const vyra::ConstantArray& array)
{
    if (array.sizeInBytes() == 0)
        return nullptr;
    AutoCLObject<cl_mem>& copy = fCopies[array.values<char>().data()];
    if (!copy.get())
        copy = createMemory(CL_MEM_READ_ONLY | CL_MEM_COPY_HOST_PTR, array.sizeInBytes(),
                            array.values<char>().data());
    return copy.get();
}

DirectKernel::DirectKernel(vyra::Deformer& deformer, unsigned pass, ConstantCopies& constants)
    : fDeformer(deformer), fPass(pass), fConstants(constants)
{
    const vyra::KernelSource source = deformer.kernel(pass);
    const std::string directory = vyra::Evaluator::kernelDirectory();
    TstringArray includes;
    includes.append(Tstring(directory.c_str()));
    const std::string file = directory + "/" + std::string(source.file);
    const std::string options = vyra::kKernelBuildOptions + (" " + std::string(source.options));
    TopenCLInfo& info = TopenCLInfo::theOne();
    fKernel = info.kernelStore().getKernel(file.c_str(), options.c_str(),
                                           std::string(source.function).c_str(), &includes);
    if (!fKernel.get())
        throw std::runtime_error("the kernel file " + file + " cannot be used");
    std::size_t global = 0;
    requireSuccess(info.getWorkGroupSizes(fKernel.get(), 1, global, fWorkGroupSize));
    fWorkGroupSize = std::min(fWorkGroupSize, vyra::kLargestWorkGroup);
}

DirectKernel::~DirectKernel()
{
    TopenCLInfo::theOne().kernelStore().freeKernel(fKernel);
}

void DirectKernel::enqueue(cl_command_queue queue, cl_uint vertexCount, const DeviceSurface& input,
                           const DeviceSurface& output)
{
    fQueue = queue;
    fIndex = 0;
    value(vertexCount);
    for (const cl_mem memory :
         {input.positions.get(), input.normals.get(), output.positions.get(), output.normals.get()})
        value(memory);
    fDeformer.setArguments(fPass, *this);
    const std::size_t global = (vertexCount + fWorkGroupSize - 1) / fWorkGroupSize * fWorkGroupSize;
    requireSuccess(clEnqueueNDRangeKernel(queue, fKernel.get(), 1, nullptr, &global,
                                          &fWorkGroupSize, 0, nullptr, nullptr));
}

void DirectKernel::setValue(const void* value, std::size_t sizeInBytes)
{
    requireSuccess(clSetKernelArg(fKernel.get(), fIndex++, sizeInBytes, value));
}

void DirectKernel::constant(const vyra::ConstantArray& array)
{
    const cl_mem memory = fConstants.copyOf(array);
    setValue(&memory, sizeof(memory));
}

// The frame before is finished, so its bytes may be overwritten.
void DirectKernel::setFrame(const void* bytes, std::size_t sizeInBytes)
{
    if (fFrameBytes.size() != sizeInBytes) {
        fFrameBytes.resize(sizeInBytes);
        fFrame = createMemory(CL_MEM_READ_ONLY, sizeInBytes, nullptr);
    }
    std::memcpy(fFrameBytes.data(), bytes, sizeInBytes);
    requireSuccess(clEnqueueWriteBuffer(fQueue, fFrame.get(), CL_FALSE, 0, sizeInBytes,
                                        fFrameBytes.data(), 0, nullptr, nullptr));
    const cl_mem memory = fFrame.get();
    const cl_uint first = 0;
    setValue(&memory, sizeof(memory));
    setValue(&first, sizeof(first));
}
