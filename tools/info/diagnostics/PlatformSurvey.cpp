#include "tools/info/diagnostics/PlatformSurvey.h"

#include "loader/OpenCLLoader.h"
#include "runtime/PlatformSelection.h"
#include "tools/info/diagnostics/DeviceSurvey.h"
#include "tools/info/diagnostics/Platform.h"
#include "tools/info/diagnostics/RenderWindow.h"

#include <exception>

namespace info {
namespace {

struct EntryPoint {
    const char* name;
    bool missing;
};

std::vector<std::string> missingOf(std::initializer_list<EntryPoint> entries)
{
    std::vector<std::string> names;
    for (const EntryPoint& entry : entries) {
        if (entry.missing)
            names.emplace_back(entry.name);
    }
    return names;
}

// Returns a text of the platform. `status` keeps the first failure of several queries.
std::string platformInfo(cl_platform_id platform, cl_platform_info name, int& status)
{
    std::vector<char> value;
    const int result = queryPlatformInfo(platform, name, value);
    if (status == CL_SUCCESS)
        status = result;
    return result == CL_SUCCESS ? platformText(value).asChar() : "";
}

Platform describePlatform(cl_platform_id id)
{
    Platform platform;
    platform.vendor = platformInfo(id, CL_PLATFORM_VENDOR, platform.status);
    platform.name = platformInfo(id, CL_PLATFORM_NAME, platform.status);
    platform.version = platformInfo(id, CL_PLATFORM_VERSION, platform.status);
    platform.extensions = platformInfo(id, CL_PLATFORM_EXTENSIONS, platform.status);
    return platform;
}

// Start-up chooses the first platform of the vendor.
bool isChosen(const Diagnostics& diagnostics, const Platform& platform)
{
    return diagnostics.startUp.lastStep > StartUpStep::kPlatform && !chosenPlatform(diagnostics) &&
           diagnostics.wantedVendor == platform.vendor;
}

} // namespace

Loader surveyLoader()
{
    Loader loader;
    try {
        clearLibraryError();
        const OpenCLLoadStatus status = loadOpenCL();
        loader.loaded = status == OpenCLLoadStatus::kLoaded;
        if (status == OpenCLLoadStatus::kNoLibrary) {
            loader.problem = libraryError();
            return loader;
        }
    } catch (const std::exception& error) {
        loader.problem = error.what();
        return loader;
    } catch (...) {
        loader.problem = "loading it threw an exception";
        return loader;
    }
    loader.file = fileOfFunction(reinterpret_cast<void*>(ocl.clGetPlatformIDs));
#define VYRA_MISSING(name) {#name, ocl.name == nullptr},
    loader.missingCore = missingOf({VYRA_OPENCL_CORE_ENTRY_POINTS(VYRA_MISSING)});
    loader.missingSharing = missingOf({VYRA_OPENCL_GL_ENTRY_POINTS(VYRA_MISSING)});
#undef VYRA_MISSING
    return loader;
}

void surveyPlatforms(RenderWindow& window, Diagnostics& diagnostics)
{
    if (!diagnostics.loader.loaded)
        return;
    cl_uint count = 0;
    diagnostics.platformStatus = ocl.clGetPlatformIDs(0, nullptr, &count);
    std::vector<cl_platform_id> ids(diagnostics.platformStatus == CL_SUCCESS ? count : 0);
    if (!ids.empty())
        diagnostics.platformStatus = ocl.clGetPlatformIDs(count, ids.data(), nullptr);
    if (diagnostics.platformStatus != CL_SUCCESS)
        return;
    for (cl_platform_id id : ids) {
        Platform platform = describePlatform(id);
        platform.chosen = isChosen(diagnostics, platform);
        surveyDevices(id, window, platform);
        diagnostics.platforms.push_back(std::move(platform));
    }
}

} // namespace info
