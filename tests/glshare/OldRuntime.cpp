// A test layer below glshare: a runtime of OpenCL 1.2 that rejects a null platform.
#include "PassThroughLayer.h"

namespace {
cl_icd_dispatch below;
}

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
    table.clSetContextDestructorCallback = nullptr;
}
