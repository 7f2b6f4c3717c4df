// A test layer that passes all calls on; changeTable may change that.
#include "PassThroughLayer.h"

#include <cstddef>

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
    static cl_icd_dispatch theTable;
    if (count < sizeof theTable / sizeof(void*))
        return CL_INVALID_VALUE;
    theTable = *below;
    if (changeTable != nullptr)
        changeTable(theTable);
    *countNeeded = sizeof theTable / sizeof(void*);
    *table = &theTable;
    return CL_SUCCESS;
}

} // extern "C"
