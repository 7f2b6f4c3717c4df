#include "evaluator/KernelPass.h"

#include "evaluator/ConstantStorage.h"
#include "evaluator/KernelBuild.h"

#include "diagnostics/CLErrorCodes.h"

#include <algorithm>
#include <cstring>
#include <utility>

namespace vyra {
namespace {

// Vertex count, positions and normals, deformed positions and normals.
constexpr cl_uint kCommonArguments = 5;

} // namespace

KernelPass::KernelPass(const OpenCLFunctions& cl, Deformer& deformer, unsigned pass,
                       RetiredMemory& retired)
    : fCL(cl), fDeformer(deformer), fPass(pass), fRetired(retired)
{
}

bool KernelPass::isCurrent(const KernelSource& source, const KernelLibrary& library) const
{
    return fKernel.get() && fGeneration == library.generation() && fFile == source.file &&
           fFunction == source.function && fOptions == source.options;
}

Status KernelPass::prepare(KernelLibrary& library)
{
    const KernelSource source = fDeformer.kernel(fPass);
    if (isCurrent(source, library))
        return {};
    LibraryKernel created = library.create(source);
    if (!created.status.ok())
        return created.status;
    // Allocates first, so that no later step fails.
    std::vector<Argument> arguments(created.argumentCount);
    std::string file(source.file);
    std::string function(source.function);
    std::string options(source.options);
    fRetired.reserve(fRetired.size() + fArguments.size());

    for (Argument& argument : fArguments) {
        if (argument.memory.get())
            fRetired.push_back(std::move(argument.memory));
    }
    fKernel = std::move(created.kernel);
    fArguments = std::move(arguments);
    fFile = std::move(file);
    fFunction = std::move(function);
    fOptions = std::move(options);
    fGeneration = created.generation;
    fWorkGroupSize = std::min(created.workGroupSize, kLargestWorkGroup);
    fNotedCount = 0;
    return {};
}

Status KernelPass::setArguments(FrameBlock& frame, KernelLibrary& library)
{
    fFrame = &frame;
    fIndex = kCommonArguments;
    fStatus = CL_SUCCESS;
    fFrameArguments.clear();
    fDeformer.setArguments(fPass, *this);
    if (fNotedCount != fIndex) {
        library.noteArguments(fDeformer.kernel(fPass), fIndex);
        fNotedCount = fIndex;
    }
    if (fIndex != fArguments.size()) {
        return Status("the kernel '" + fFunction + "' of " + fFile + " takes " +
                      std::to_string(fArguments.size()) + " arguments, and its deformer passes " +
                      std::to_string(fIndex) + ", with the " + std::to_string(kCommonArguments) +
                      " common ones; make the two agree");
    }
    if (fStatus != CL_SUCCESS) {
        return Status("an argument of the kernel '" + fFunction + "' of " + fFile +
                          " cannot be set (" + CLErrorCodeStr(fStatus) +
                          "); check its type and size",
                      fStatus);
    }
    return {};
}

void KernelPass::setValue(const void* value, std::size_t sizeInBytes)
{
    set(fIndex++, value, sizeInBytes);
}

void KernelPass::setFrame(const void* bytes, std::size_t sizeInBytes)
{
    const cl_uint first = fFrame->append(bytes, sizeInBytes);
    fFrameArguments.push_back(fIndex++);
    set(fIndex++, &first, sizeof(first));
}

void KernelPass::constant(const ConstantArray& array)
{
    cl_int status = CL_SUCCESS;
    cl_mem memory = nullptr;
    if (const auto& storage = array.storage())
        memory = storage->memory(status);
    if (status != CL_SUCCESS && fStatus == CL_SUCCESS)
        fStatus = status;
    setMemory(fIndex++, memory);
}

// Skips the call if the argument has that value already. Returns whether it was set.
bool KernelPass::set(cl_uint index, const void* value, std::size_t sizeInBytes)
{
    if (fStatus != CL_SUCCESS || index >= fArguments.size())
        return false;
    Argument& argument = fArguments[index];
    if (argument.sizeInBytes == sizeInBytes &&
        std::memcmp(argument.bytes.data(), value, sizeInBytes) == 0)
        return false;
    argument.sizeInBytes = 0;
    fStatus = fCL.clSetKernelArg(fKernel.get(), index, sizeInBytes, value);
    if (fStatus != CL_SUCCESS)
        return false;
    if (sizeInBytes <= argument.bytes.size()) {
        std::memcpy(argument.bytes.data(), value, sizeInBytes);
        argument.sizeInBytes = sizeInBytes;
    }
    return true;
}

// Sets memory that the deformer or the frame block may release at any time. Commands of earlier
// evaluations may still use what the argument was before.
void KernelPass::setMemory(cl_uint index, cl_mem memory)
{
    fRetired.reserve(fRetired.size() + 1);
    if (!set(index, &memory, sizeof(memory)))
        return;
    AutoCLObject<cl_mem> kept;
    if (memory) {
        retainCLObject(memory); // released by `kept`
        kept.adopt(memory);
    }
    std::swap(fArguments[index].memory, kept);
    if (kept.get())
        fRetired.push_back(std::move(kept));
}

cl_int KernelPass::enqueue(cl_command_queue queue, cl_uint vertexCount, const VertexMemory& input,
                           const VertexMemory& output, cl_mem frame, const AutoCLEventList& waits,
                           AutoCLObject<cl_event>& event)
{
    set(0, &vertexCount, sizeof(vertexCount));
    set(1, &input.positions, sizeof(cl_mem));
    set(2, &input.normals, sizeof(cl_mem));
    set(3, &output.positions, sizeof(cl_mem));
    set(4, &output.normals, sizeof(cl_mem));
    for (const cl_uint index : fFrameArguments)
        setMemory(index, frame);
    if (fStatus != CL_SUCCESS)
        return fStatus;
    const std::size_t global = (vertexCount + fWorkGroupSize - 1) / fWorkGroupSize * fWorkGroupSize;
    AutoCLObject<cl_event> enqueued;
    const cl_int status =
        fCL.clEnqueueNDRangeKernel(queue, fKernel.get(), 1, nullptr, &global, &fWorkGroupSize,
                                   waits.size(), waits.array(), enqueued.receive());
    if (status == CL_SUCCESS)
        event = std::move(enqueued);
    return status;
}

} // namespace vyra
