// Objects that a test creates without the library, and owns.
#pragma once

#include "ScriptedTest.h"
#include "interop/TopenCLSharedBufferMgr.h"
#include "loader/OpenCLLoader.h"

namespace scripted {

inline AutoCLObject<cl_mem> makeMem()
{
    AutoCLObject<cl_mem> mem;
    mem.adopt(ocl.clCreateBuffer(context(), 1, 4, nullptr, nullptr));
    return mem;
}

inline AutoCLObject<cl_event> makeEvent()
{
    const AutoCLObject<cl_mem> mem = makeMem();
    AutoCLObject<cl_event> event;
    ocl.clEnqueueReadBuffer(queue(), mem.get(), CL_FALSE, 0, 4, &event, 0, nullptr,
                            event.receive());
    return event;
}

// Creates a shared buffer of the renderer's buffer 7.
inline const TopenCLSharedBuffer* makeShared(TopenCLSharedBufferMgr& manager, int* status)
{
    unsigned glBuffer = 7;
    return manager.CreateSharedCLBuffer(context(), CL_MEM_READ_WRITE, &glBuffer, status);
}

} // namespace scripted
