// A deformer's kernel, run by direct OpenCL calls.
#pragma once

#include "diagnostics/AutoCLObject.h"
#include "evaluator/Deformer.h"

#include <map>
#include <vector>

#include <CL/cl.h>

// Positions and normals in device memory.
struct DeviceSurface {
    AutoCLObject<cl_mem> positions;
    AutoCLObject<cl_mem> normals;
};

// Device copies of constant arrays, each made once. Several threads may ask for copies that exist.
class ConstantCopies {
public:
    cl_mem copyOf(const vyra::ConstantArray& array);

private:
    std::map<const void*, AutoCLObject<cl_mem>> fCopies; // by the array's elements
};

// One pass of a deformer. A failure of OpenCL throws std::runtime_error.
class DirectKernel final : private vyra::KernelArguments {
public:
    // Borrows the deformer and the copies.
    DirectKernel(vyra::Deformer& deformer, unsigned pass, ConstantCopies& constants);
    ~DirectKernel();

    // Uploads the numbers of the frame if there are any, and enqueues one work-item per vertex.
    void enqueue(cl_command_queue queue, cl_uint vertexCount, const DeviceSurface& input,
                 const DeviceSurface& output);

private:
    void setValue(const void* value, std::size_t sizeInBytes) override;
    void setFrame(const void* bytes, std::size_t sizeInBytes) override;
    void constant(const vyra::ConstantArray& array) override;

    vyra::Deformer& fDeformer;
    unsigned fPass;
    ConstantCopies& fConstants;
    AutoCLObject<cl_kernel> fKernel;
    std::size_t fWorkGroupSize = 0;
    cl_command_queue fQueue = nullptr; // of the kernel being enqueued
    cl_uint fIndex = 0;
    AutoCLObject<cl_mem> fFrame;
    std::vector<char> fFrameBytes; // what a pending upload reads
};

// Throws std::runtime_error unless the status is CL_SUCCESS.
void requireSuccess(cl_int status);
