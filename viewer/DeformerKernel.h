// A kernel of the kernel store, for as long as a deformer needs it.
#pragma once

#include "diagnostics/AutoCLEventList.h"
#include "diagnostics/AutoCLObject.h"
#include "viewer/KernelFiles.h"
#include "viewer/OpenCLFunctions.h"

#include <cstddef>

#include <CL/cl.h>

namespace viewer {

// Asks the store once and gives the kernel back at the end: a store whose last kernel goes drops
// the program too, and would build it again for the next request. One thread at a time uses an
// object; no two objects share a kernel.
class DeformerKernel {
public:
    // `file` and `name`, which are borrowed, tell `files` what kernel it is.
    DeformerKernel(const OpenCLFunctions& cl, const char* file, const char* name,
                   KernelFiles& files);
    ~DeformerKernel();
    DeformerKernel(const DeformerKernel&) = delete;
    DeformerKernel& operator=(const DeformerKernel&) = delete;

    // False when the file cannot be read or does not build.
    bool valid() const { return fKernel.get() != nullptr; }

    // Takes a kernel of the text that the file now stands for; keeps the present one where there is
    // none to be had. Commands enqueued before are not touched.
    void renew(KernelFiles& files);

    // Enqueues one work-item per element with these arguments (memory objects and plain numbers,
    // in the kernel's order), after `waits`. `event` receives the command's event. A status of
    // OpenCL; nothing is enqueued unless it is CL_SUCCESS.
    template <typename... Arguments>
    cl_int enqueue(cl_command_queue queue, std::size_t elements, const AutoCLEventList& waits,
                   AutoCLObject<cl_event>& event, const Arguments&... arguments)
    {
        cl_uint index = 0;
        cl_int status = CL_SUCCESS;
        ((status = status == CL_SUCCESS ? setArgument(index++, arguments) : status), ...);
        return status == CL_SUCCESS ? enqueue(queue, elements, waits, event) : status;
    }

private:
    template <typename Argument>
    cl_int setArgument(cl_uint index, const Argument& argument)
    {
        return fCL.clSetKernelArg(fKernel.get(), index, sizeof(Argument), &argument);
    }
    cl_int enqueue(cl_command_queue queue, std::size_t elements, const AutoCLEventList& waits,
                   AutoCLObject<cl_event>& event);

    const OpenCLFunctions& fCL;
    const char* fFile;
    const char* fName;
    AutoCLObject<cl_kernel> fKernel;
};

} // namespace viewer
