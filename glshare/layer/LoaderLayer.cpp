// The shell for OpenCL loaders that know layers: hands the loader a table of functions in which
// ours stand in front of those below.
#include "core/OpenCl.h"
#include "entry/EntryPoints.h"

#include "core/Answer.h"

#include <CL/cl_layer.h>

#include <cstring>
#include <span>
#include <string_view>

namespace {

// The number of functions in a table, which is how loaders and layers of different age agree.
constexpr cl_uint kFunctions = sizeof(cl_icd_dispatch) / sizeof(void*);

constexpr std::string_view kName = "OpenGL buffer sharing in software (glshare)";

} // namespace

extern "C" {

[[gnu::visibility("default")]] cl_int CL_API_CALL clGetLayerInfo(cl_layer_info name,
                                                                 std::size_t size, void* value,
                                                                 std::size_t* sizeNeeded)
{
    const glshare::Query query{size, value, sizeNeeded};
    switch (name) {
    case CL_LAYER_API_VERSION:
        return glshare::answerWith(cl_layer_api_version{CL_LAYER_API_VERSION_100}, query);
    case CL_LAYER_NAME:
        return glshare::answer(std::as_bytes(std::span(kName.data(), kName.size() + 1)), query);
    default:
        return CL_INVALID_VALUE;
    }
}

// The loader keeps the table for the life of the process.
[[gnu::visibility("default")]] cl_int CL_API_CALL clInitLayer(cl_uint count,
                                                              const cl_icd_dispatch* below,
                                                              cl_uint* countNeeded,
                                                              const cl_icd_dispatch** table)
{
    static cl_icd_dispatch theTable;
    // A second initialisation would put this layer on top of itself, which never ends.
    static bool isInitialised = false;
    if (isInitialised || below == nullptr || countNeeded == nullptr || table == nullptr ||
        count < kFunctions)
        return CL_INVALID_VALUE;
    theTable = *below;
    glshare::setRuntime(*below);
    glshare::installEntryPoints(theTable);
    isInitialised = true;
    *countNeeded = kFunctions;
    *table = &theTable;
    return CL_SUCCESS;
}

} // extern "C"
