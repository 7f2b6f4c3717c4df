// A layer that changes nothing, for tests between others. With GLSHARE_TEST_OLD_RUNTIME, a runtime
// under it looks like one of OpenCL 1.2 that insists on a platform.
#undef CL_TARGET_OPENCL_VERSION
#define CL_TARGET_OPENCL_VERSION 300
#include <CL/cl_layer.h>

#include <cstddef>

namespace {

cl_icd_dispatch theTable;
[[maybe_unused]] cl_icd_dispatch theRuntime;

#ifdef GLSHARE_TEST_OLD_RUNTIME
void makeOld(cl_icd_dispatch& table)
{
    table.clGetPlatformInfo = [](cl_platform_id platform, cl_platform_info name, std::size_t size,
                                 void* value, std::size_t* needed) -> cl_int {
        return name == CL_PLATFORM_NUMERIC_VERSION
                   ? CL_INVALID_VALUE
                   : theRuntime.clGetPlatformInfo(platform, name, size, value, needed);
    };
    table.clGetDeviceIDs = [](cl_platform_id platform, cl_device_type type, cl_uint capacity,
                              cl_device_id* devices, cl_uint* count) -> cl_int {
        return platform == nullptr
                   ? CL_INVALID_PLATFORM
                   : theRuntime.clGetDeviceIDs(platform, type, capacity, devices, count);
    };
    table.clSetContextDestructorCallback = nullptr;
}
#else
void makeOld(cl_icd_dispatch& /*table*/) {}
#endif

} // namespace

extern "C" {

[[gnu::visibility("default")]] cl_int CL_API_CALL clGetLayerInfo(cl_layer_info name,
                                                                 std::size_t size, void* value,
                                                                 std::size_t* sizeNeeded)
{
    if (name != CL_LAYER_API_VERSION)
        return CL_INVALID_VALUE;
    if (sizeNeeded != nullptr)
        *sizeNeeded = sizeof(cl_layer_api_version);
    if (value != nullptr && size >= sizeof(cl_layer_api_version))
        *static_cast<cl_layer_api_version*>(value) = CL_LAYER_API_VERSION_100;
    return CL_SUCCESS;
}

[[gnu::visibility("default")]] cl_int CL_API_CALL clInitLayer(cl_uint count,
                                                              const cl_icd_dispatch* below,
                                                              cl_uint* countNeeded,
                                                              const cl_icd_dispatch** table)
{
    if (count < sizeof theTable / sizeof(void*))
        return CL_INVALID_VALUE;
    theTable = *below;
    theRuntime = *below;
    makeOld(theTable);
    *countNeeded = sizeof theTable / sizeof(void*);
    *table = &theTable;
    return CL_SUCCESS;
}

} // extern "C"
