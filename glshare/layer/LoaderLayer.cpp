// The layer for the OpenCL loader. It returns a table in which the functions of EntryPoints.h
// replace those of the layer below.
#include "core/api/Arguments.h"
#include "core/api/OpenCl.h"
#include "entry/EntryPoints.h"

#include <CL/cl_layer.h>

#include <array>
#include <cstddef>
#include <cstring>
#include <span>
#include <string_view>

#include <link.h>

namespace {

// The number of functions in a table, by which loaders and layers compare their versions.
constexpr cl_uint kFunctions = sizeof(cl_icd_dispatch) / sizeof(void*);

constexpr std::string_view kName = "OpenGL buffer sharing in software (glshare)";

std::array<void*, kFunctions> functionsOf(const cl_icd_dispatch& table)
{
    std::array<void*, kFunctions> functions{};
    std::memcpy(functions.data(), &table, sizeof table);
    return functions;
}

// Returns whether a function of `below` is this layer's.
bool isStackedOnItself(const cl_icd_dispatch& below)
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

// Returns the number of libraries that the process has unloaded so far.
unsigned long long unloadedLibraries()
{
    unsigned long long count = 0;
    dl_iterate_phdr(
        [](dl_phdr_info* info, std::size_t, void* result) {
            *static_cast<unsigned long long*>(result) = info->dlpi_subs;
            return 1; // every library reports the same number
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
    const glshare::InfoOutput output{size, value, sizeNeeded};
    switch (name) {
    case CL_LAYER_API_VERSION:
        return glshare::writeInfoValue(cl_layer_api_version{CL_LAYER_API_VERSION_100}, output);
    case CL_LAYER_NAME:
        return glshare::writeInfo(std::as_bytes(std::span(kName.data(), kName.size() + 1)), output);
    default:
        return CL_INVALID_VALUE;
    }
}

// The loader uses the table until it is unloaded. The layer itself stays loaded, and is initialised
// again if the process reloads the loader. A second initialisation without an unloaded library is
// by the same loader: it would stack the layer on itself, and each call would recurse without end.
[[gnu::visibility("default")]] cl_int CL_API_CALL clInitLayer(cl_uint count,
                                                              const cl_icd_dispatch* below,
                                                              cl_uint* countNeeded,
                                                              const cl_icd_dispatch** table)
{
    static cl_icd_dispatch theTable;
    static bool isInitialized = false;
    static unsigned long long unloadedBefore = 0;
    if (below == nullptr || countNeeded == nullptr || table == nullptr || count < kFunctions)
        return CL_INVALID_VALUE;
    const unsigned long long unloaded = unloadedLibraries();
    if (isStackedOnItself(*below) || (isInitialized && unloaded == unloadedBefore))
        return CL_INVALID_VALUE;
    theTable = *below;
    glshare::setRuntime(*below);
    glshare::installEntryPoints(theTable);
    isInitialized = true;
    unloadedBefore = unloaded;
    *countNeeded = kFunctions;
    *table = &theTable;
    return CL_SUCCESS;
}

} // extern "C"
