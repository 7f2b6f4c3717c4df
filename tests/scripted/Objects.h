// Objects that a test creates without the library, and owns.
#pragma once

#include "interop/TopenCLSharedBufferMgr.h"
#include "loader/OpenCLLoader.h"
#include "runtime/TopenCLInfo.h"

namespace scripted {

inline cl_mem makeMem()
{
    return ocl.clCreateBuffer(TopenCLInfo::theOne().openCLContext(), 1, 4, nullptr, nullptr);
}

inline cl_event makeEvent()
{
    const cl_mem mem = makeMem();
    cl_event event = nullptr;
    ocl.clEnqueueReadBuffer(TopenCLInfo::theOne().openCLCommandQueue(), mem, CL_FALSE, 0, 4, &event,
                            0, nullptr, &event);
    ocl.clReleaseMemObject(mem);
    return event;
}

// A program that is built, with a kernel "deform".
inline cl_program makeProgram()
{
    const char* source = "deform";
    const cl_device_id device = TopenCLInfo::theOne().openCLDevice();
    const cl_program program = ocl.clCreateProgramWithSource(TopenCLInfo::theOne().openCLContext(),
                                                             1, &source, nullptr, nullptr);
    ocl.clBuildProgram(program, 1, &device, "", nullptr, nullptr);
    return program;
}

// Creates a shared buffer of the renderer's buffer 7.
inline const TopenCLSharedBuffer* makeShared(TopenCLSharedBufferMgr& manager, int* status)
{
    unsigned glBuffer = 7;
    return manager.CreateSharedCLBuffer(TopenCLInfo::theOne().openCLContext(), CL_MEM_READ_WRITE,
                                        &glBuffer, status);
}

} // namespace scripted
