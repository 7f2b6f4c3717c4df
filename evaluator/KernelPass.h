// One pass of a deformer: its kernel object and the arguments of the kernel. Internal.
#pragma once

#include "evaluator/Deformer.h"
#include "evaluator/FrameBlock.h"
#include "evaluator/KernelArguments.h"
#include "evaluator/KernelLibrary.h"
#include "evaluator/OpenCLFunctions.h"
#include "evaluator/Status.h"
#include "evaluator/StoreKernel.h"

#include "diagnostics/AutoCLEventList.h"
#include "diagnostics/AutoCLObject.h"

#include <array>
#include <cstddef>
#include <string>
#include <vector>

#include <CL/cl.h>

namespace vyra {

// Positions and normals that a kernel reads or writes.
struct VertexMemory {
    cl_mem positions = nullptr;
    cl_mem normals = nullptr;
};

// Memory objects that kernels no longer name, but that commands may still use.
using RetiredMemory = std::vector<AutoCLObject<cl_mem>>;

// The owner of a pass's kernel object; arguments that did not change are not set again. One object
// is used by one thread at a time.
class KernelPass final : private KernelArguments {
public:
    // Borrows all arguments. `retired` receives the memory of arguments that were replaced.
    KernelPass(const OpenCLFunctions& cl, Deformer& deformer, unsigned pass,
               RetiredMemory& retired);

    // Creates the kernel if there is none yet, if the deformer returns another source, or if its
    // file was replaced. A failure changes nothing.
    Status prepare(KernelLibrary& library);

    // Sets the deformer's arguments and copies its frame data to `frame`.
    Status setArguments(FrameBlock& frame, KernelLibrary& library);
    // Returns whether the last arguments included frame data.
    bool usesFrame() const { return !fFrameArguments.empty(); }

    // Enqueues one work-item per vertex after `waits`. Returns an OpenCL status; `event` receives
    // the command's event on success.
    cl_int enqueue(cl_command_queue queue, cl_uint vertexCount, const VertexMemory& input,
                   const VertexMemory& output, cl_mem frame, const AutoCLEventList& waits,
                   AutoCLObject<cl_event>& event);

private:
    // The last value of an argument. A value that does not fit is set in each evaluation.
    struct Argument {
        std::size_t sizeInBytes = 0; // 0: not set yet, or not kept
        std::array<std::byte, 64> bytes{};
        // Keeps the memory that the deformer may replace, and with it the meaning of the handle.
        AutoCLObject<cl_mem> memory;
    };

    void setValue(const void* value, std::size_t sizeInBytes) override;
    void setFrame(const void* bytes, std::size_t sizeInBytes) override;
    void constant(const ConstantArray& array) override;
    bool set(cl_uint index, const void* value, std::size_t sizeInBytes);
    void setMemory(cl_uint index, cl_mem memory);
    bool isCurrent(const KernelSource& source, const KernelLibrary& library) const;

    const OpenCLFunctions& fCL;
    Deformer& fDeformer;
    unsigned fPass;
    RetiredMemory& fRetired;
    StoreKernel fKernel;
    std::string fFile; // of the kernel, with the two members below
    std::string fFunction;
    std::string fOptions;
    unsigned fGeneration = 0;
    std::size_t fWorkGroupSize = 0;
    std::vector<Argument> fArguments;
    cl_uint fNotedCount = 0; // the argument count last reported to the library

    // While the deformer's arguments are set.
    FrameBlock* fFrame = nullptr;
    cl_uint fIndex = 0;
    cl_int fStatus = CL_SUCCESS;
    std::vector<cl_uint> fFrameArguments; // indices of the arguments that receive the frame memory
};

} // namespace vyra
