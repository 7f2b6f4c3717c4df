#include "evaluator/OpenCLFunctions.h"

#include "loader/OpenCLLibraryName.h"

#include <optional>

#if defined(_WIN32)
#include <windows.h>
#else
#include <dlfcn.h>
#endif

namespace vyra {
namespace {

#if defined(_WIN32)

void* openLibrary()
{
    return LoadLibraryA(kOpenCLLibraryName);
}

void* findFunction(void* library, const char* name)
{
    return reinterpret_cast<void*>(GetProcAddress(static_cast<HMODULE>(library), name));
}

#else

void* openLibrary()
{
    return dlopen(kOpenCLLibraryName, RTLD_NOW | RTLD_LOCAL);
}

void* findFunction(void* library, const char* name)
{
    return dlsym(library, name);
}

#endif

template <typename Function>
bool resolve(void* library, const char* name, Function& function)
{
    function = reinterpret_cast<Function>(findFunction(library, name));
    return function != nullptr;
}

std::optional<OpenCLFunctions> load()
{
    void* library = openLibrary();
    if (!library)
        return std::nullopt;
    OpenCLFunctions cl;
    const bool complete =
        resolve(library, "clGetMemObjectInfo", cl.clGetMemObjectInfo) &&
        resolve(library, "clGetEventInfo", cl.clGetEventInfo) &&
        resolve(library, "clGetKernelInfo", cl.clGetKernelInfo) &&
        resolve(library, "clCreateCommandQueue", cl.clCreateCommandQueue) &&
        resolve(library, "clReleaseCommandQueue", cl.clReleaseCommandQueue) &&
        resolve(library, "clSetKernelArg", cl.clSetKernelArg) &&
        resolve(library, "clEnqueueNDRangeKernel", cl.clEnqueueNDRangeKernel) &&
        resolve(library, "clEnqueueCopyBuffer", cl.clEnqueueCopyBuffer) &&
        resolve(library, "clEnqueueMarkerWithWaitList", cl.clEnqueueMarkerWithWaitList) &&
        resolve(library, "clGetEventProfilingInfo", cl.clGetEventProfilingInfo) &&
        resolve(library, "clWaitForEvents", cl.clWaitForEvents) &&
        resolve(library, "clFlush", cl.clFlush) && resolve(library, "clFinish", cl.clFinish);
    return complete ? std::optional(cl) : std::nullopt;
}

} // namespace

const OpenCLFunctions* openCLFunctions()
{
    static const std::optional<OpenCLFunctions> functions = load();
    return functions ? &*functions : nullptr;
}

} // namespace vyra
