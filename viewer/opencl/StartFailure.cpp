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
constexpr char kPoclVendor[] = "The pocl project";

// Vendors in quotes, each once.
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

std::vector<OpenCLPlatform> thatShare(std::vector<OpenCLPlatform> platforms)
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
            "use a GPU whose driver does, or set OPENCL_LAYERS to the path of libglshare.so"};
}

// The library looked for the platform of one vendor.
Reason reasonOfPlatform(const StartFacts& facts)
{
    const auto platform =
        std::find_if(facts.platforms.begin(), facts.platforms.end(),
                     [&facts](const OpenCLPlatform& each) { return each.vendor == facts.vendor; });
    if (platform == facts.platforms.end())
        return {"no OpenCL platform has the vendor '" + facts.vendor + "'",
                "there is " + listOf(facts.platforms) + ": name one exactly like that"};
    if (platform->deviceCount == 0)
        return noDevices(*platform);
    if (!platform->sharesWithOpenGL)
        return noSharing("the OpenCL platform of '" + facts.vendor + "' does not offer");
    return {};
}

// The renderer's texts name no vendor.
Reason reasonOfPlatforms(const StartFacts& facts)
{
    const std::vector<OpenCLPlatform> sharing = thatShare(facts.platforms);
    const auto hasNoDevices = [](const auto& platform) { return platform.deviceCount == 0; };
    if (std::all_of(facts.platforms.begin(), facts.platforms.end(), hasNoDevices))
        return noDevices(facts.platforms.front());
    if (sharing.empty())
        return noSharing("no OpenCL platform offers");
    return {"several OpenCL platforms share with OpenGL",
            "choose one with --platform: " + listOf(sharing)};
}

Reason reasonOf(const StartFacts& facts)
{
    if (!facts.missingLayers.empty())
        return {"OPENCL_LAYERS names '" + facts.missingLayers.front() + "', which is not a file",
                "correct the variable"};
    if (facts.disabled)
        return {"OpenCL is switched off, since VYRA_DISABLE_OPENCL is set", "unset the variable"};
    if (!facts.libraryFound)
        return {"there is no OpenCL on this machine", kInstallDriver};
    if (facts.platforms.empty())
        return {"OpenCL has no platform on this machine: the loader found no driver",
                kInstallDriver};
    if (!facts.vendor.empty()) {
        if (Reason reason = reasonOfPlatform(facts); !reason.text.empty())
            return reason;
    } else if (facts.vendorId == 0) {
        return reasonOfPlatforms(facts);
    }
    const std::string advice = facts.platformIsGiven ? "" : "name another platform with --platform";
    const std::string text = "OpenCL cannot be used with this renderer";
    if (!facts.warnings.empty())
        return {text + " (" + facts.warnings.back() + ")", advice};
    return {text + ", for the reason above", advice};
}

} // namespace

Failure startFailure(const StartFacts& facts)
{
    const Reason reason = reasonOf(facts);
    std::string text = reason.text;
    if (!reason.advice.empty())
        text += "; " + reason.advice;
    if (!facts.cpuIsAllowed)
        text += (reason.advice.empty() ? "; use " : ", or use ") + std::string("--allow-cpu");
    return {ExitCode::kNoOpenCL, text};
}

} // namespace viewer
