// A test layer below glshare: a runtime of OpenCL 1.2 that rejects a null platform. It ends the
// process when it is to destroy a context that glshare has not forgotten.
#include "PassThroughLayer.h"

#include <cstdio>
#include <cstdlib>

namespace {

cl_icd_dispatch below;

// Another thread may get the handle as soon as the context is destroyed.
cl_int releaseContext(cl_context context)
{
    cl_uint references = 0;
    std::size_t size = 0;
    std::size_t sizeBelow = 0;
    below.clGetContextInfo(context, CL_CONTEXT_REFERENCE_COUNT, sizeof references, &references,
                           nullptr);
    below.clGetContextInfo(context, CL_CONTEXT_PROPERTIES, 0, nullptr, &sizeBelow);
    clGetContextInfo(context, CL_CONTEXT_PROPERTIES, 0, nullptr, &size); // asks glshare
    if (references == 1 && size != sizeBelow) {
        std::fputs("glshare has not forgotten a context that is destroyed\n", stderr);
        std::abort();
    }
    return below.clReleaseContext(context);
}

} // namespace

void changeTable(cl_icd_dispatch& table)
{
    below = table;
    table.clGetPlatformInfo = [](cl_platform_id platform, cl_platform_info name, std::size_t size,
                                 void* value, std::size_t* needed) -> cl_int {
        return name == CL_PLATFORM_NUMERIC_VERSION
                   ? CL_INVALID_VALUE
                   : below.clGetPlatformInfo(platform, name, size, value, needed);
    };
    table.clGetDeviceIDs = [](cl_platform_id platform, cl_device_type type, cl_uint capacity,
                              cl_device_id* devices, cl_uint* count) -> cl_int {
        return platform == nullptr ? CL_INVALID_PLATFORM
                                   : below.clGetDeviceIDs(platform, type, capacity, devices, count);
    };
    table.clReleaseContext = releaseContext;
    table.clSetContextDestructorCallback = nullptr;
}
