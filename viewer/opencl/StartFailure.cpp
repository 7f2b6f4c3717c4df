#include "viewer/opencl/StartFailure.h"

#include <algorithm>

namespace viewer {
namespace {

struct Reason {
    std::string text;
    std::string advice; // may be empty
};

constexpr char kInstallDriver[] =
    "install an OpenCL driver (on Debian without a GPU: pocl-opencl-icd)";
#if defined(_WIN32)
constexpr char kUseGlshare[] = "copy glshare's OpenCL.dll to the folder of the program";
#else
constexpr char kUseGlshare[] = "set OPENCL_LAYERS to the path of libglshare.so";
#endif
constexpr char kPoclVendor[] = "The pocl project";

// Returns the vendors in quotes, without duplicates.
std::string listOf(const std::vector<OpenCLPlatform>& platforms)
{
    std::vector<std::string> vendors;
    std::string list;
    for (const OpenCLPlatform& platform : platforms) {
        if (std::find(vendors.begin(), vendors.end(), platform.vendor) != vendors.end())
            continue;
        vendors.push_back(platform.vendor);
        list += (list.empty() ? "'" : ", '") + platform.vendor + "'";
    }
    return list;
}

std::vector<OpenCLPlatform> withGLSharing(std::vector<OpenCLPlatform> platforms)
{
    std::erase_if(platforms, [](const auto& platform) { return !platform.sharesWithOpenGL; });
    return platforms;
}

Reason noDevices(const OpenCLPlatform& platform)
{
    return {"the OpenCL platform of '" + platform.vendor + "' has 0 devices",
            platform.vendor == kPoclVendor
                ? "PoCL has none if it cannot write its cache: set POCL_CACHE_DIR to a folder that "
                  "can be written"
                : "check its driver and the permissions of the device files"};
}

Reason noSharing(const std::string& subject)
{
    return {subject + " cl_khr_gl_sharing",
            std::string("use a GPU whose driver does, or ") + kUseGlshare};
}

// For a library that looked for the platform of one vendor. An empty reason if there is no fault.
Reason reasonOfVendor(const StartDiagnostics& diagnostics)
{
    const auto platform = std::find_if(
        diagnostics.platforms.begin(), diagnostics.platforms.end(),
        [&diagnostics](const OpenCLPlatform& each) { return each.vendor == diagnostics.vendor; });
    if (platform == diagnostics.platforms.end())
        return {"no OpenCL platform has the vendor '" + diagnostics.vendor + "'",
                "there is " + listOf(diagnostics.platforms) + ": name one exactly like that"};
    if (platform->deviceCount == 0)
        return noDevices(*platform);
    if (!platform->sharesWithOpenGL)
        return noSharing("the OpenCL platform of '" + diagnostics.vendor + "' does not offer");
    return {};
}

// For a renderer of an unknown vendor.
Reason reasonWithoutVendor(const StartDiagnostics& diagnostics)
{
    const std::vector<OpenCLPlatform> sharing = withGLSharing(diagnostics.platforms);
    const auto hasNoDevices = [](const auto& platform) { return platform.deviceCount == 0; };
    if (std::all_of(diagnostics.platforms.begin(), diagnostics.platforms.end(), hasNoDevices))
        return noDevices(diagnostics.platforms.front());
    if (sharing.empty())
        return noSharing("no OpenCL platform offers");
    return {"several OpenCL platforms share with OpenGL",
            "choose one with --platform: " + listOf(sharing)};
}

Reason reasonOf(const StartDiagnostics& diagnostics)
{
    if (!diagnostics.missingLayers.empty())
        return {"OPENCL_LAYERS names '" + diagnostics.missingLayers.front() +
                    "', which is not a file",
                "correct the variable"};
    if (diagnostics.disabled)
        return {"OpenCL is switched off, since VYRA_DISABLE_OPENCL is set", "unset the variable"};
    if (!diagnostics.libraryFound)
        return {"there is no OpenCL on this machine", kInstallDriver};
    if (diagnostics.platforms.empty())
        return {"OpenCL has no platform on this machine: the loader found no driver",
                kInstallDriver};
    if (!diagnostics.vendor.empty()) {
        if (Reason reason = reasonOfVendor(diagnostics); !reason.text.empty())
            return reason;
    } else if (diagnostics.vendorId == 0) {
        return reasonWithoutVendor(diagnostics);
    }
    const std::string advice =
        diagnostics.platformIsGiven ? "" : "name another platform with --platform";
    const std::string text = "OpenCL cannot be used with this renderer";
    if (!diagnostics.warnings.empty())
        return {text + " (" + diagnostics.warnings.back() + ")", advice};
    return {text + ", for the reason above", advice};
}

} // namespace

Failure startFailure(const StartDiagnostics& diagnostics)
{
    const Reason reason = reasonOf(diagnostics);
    std::string text = reason.text;
    if (!reason.advice.empty())
        text += "; " + reason.advice;
    if (!diagnostics.cpuIsAllowed)
        text += (reason.advice.empty() ? "; use " : ", or use ") + std::string("--allow-cpu");
    return {ExitCode::kNoOpenCL, text};
}

} // namespace viewer
