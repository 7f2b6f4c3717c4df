// The shell for OpenCL loaders that know layers: hands the loader a table of functions in which
// ours stand in front of those below.
#include "core/api/OpenCl.h"
#include "entry/EntryPoints.h"

#include "core/api/Answer.h"

#include <CL/cl_layer.h>

#include <array>
#include <cstddef>
#include <cstring>
#include <span>
#include <string_view>

#include <link.h>

namespace {

// The number of functions in a table, which is how loaders and layers of different age agree.
constexpr cl_uint kFunctions = sizeof(cl_icd_dispatch) / sizeof(void*);

constexpr std::string_view kName = "OpenGL buffer sharing in software (glshare)";

std::array<void*, kFunctions> functionsOf(const cl_icd_dispatch& table)
{
    std::array<void*, kFunctions> functions{};
    std::memcpy(functions.data(), &table, sizeof table);
    return functions;
}

// Whether calls to `below` come back to this layer.
bool liesOverItself(const cl_icd_dispatch& below)
{
    cl_icd_dispatch entryPoints{};
    glshare::installEntryPoints(entryPoints);
    const auto own = functionsOf(entryPoints);
    const auto others = functionsOf(below);
    for (std::size_t i = 0; i < own.size(); ++i) {
        if (own[i] != nullptr && own[i] == others[i])
            return true;
    }
    return false;
}

// How many libraries the process has unloaded so far.
unsigned long long unloadedLibraries()
{
    unsigned long long count = 0;
    dl_iterate_phdr(
        [](dl_phdr_info* info, std::size_t, void* result) {
            *static_cast<unsigned long long*>(result) = info->dlpi_subs;
            return 1; // the number is the same for all
        },
        &count);
    return count;
}

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

// The loader keeps the table until it is unloaded. This layer stays then, and starts again when the
// process loads the loader again. A second start under the same loader, which has unloaded nothing,
// would put the layer on top of itself: such calls never return.
[[gnu::visibility("default")]] cl_int CL_API_CALL clInitLayer(cl_uint count,
                                                              const cl_icd_dispatch* below,
                                                              cl_uint* countNeeded,
                                                              const cl_icd_dispatch** table)
{
    static cl_icd_dispatch theTable;
    static bool isStarted = false;
    static unsigned long long unloadedAtStart = 0;
    if (below == nullptr || countNeeded == nullptr || table == nullptr || count < kFunctions)
        return CL_INVALID_VALUE;
    const unsigned long long unloaded = unloadedLibraries();
    if (liesOverItself(*below) || (isStarted && unloaded == unloadedAtStart))
        return CL_INVALID_VALUE;
    theTable = *below;
    glshare::setRuntime(*below);
    glshare::installEntryPoints(theTable);
    isStarted = true;
    unloadedAtStart = unloaded;
    *countNeeded = kFunctions;
    *table = &theTable;
    return CL_SUCCESS;
}

} // extern "C"
