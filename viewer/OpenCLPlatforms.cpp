#include "viewer/OpenCLPlatforms.h"

#include <algorithm>

namespace viewer {
namespace {

constexpr char kSharingExtension[] = "cl_khr_gl_sharing";

std::string platformText(const OpenCLFunctions& cl, cl_platform_id platform, cl_platform_info info)
{
    std::size_t size = 0;
    if (cl.clGetPlatformInfo(platform, info, 0, nullptr, &size) != CL_SUCCESS || size == 0)
        return {};
    std::string text(size, '\0');
    if (cl.clGetPlatformInfo(platform, info, size, text.data(), nullptr) != CL_SUCCESS)
        return {};
    text.resize(size - 1); // without the NUL
    return text;
}

std::string quotedList(const std::vector<std::string>& texts)
{
    std::string list;
    for (const std::string& text : texts)
        list += (list.empty() ? "'" : ", '") + text + "'";
    return list;
}

std::vector<std::string> vendorsThatShare(const std::vector<OpenCLPlatform>& platforms)
{
    std::vector<std::string> vendors;
    for (const OpenCLPlatform& platform : platforms) {
        const bool shares = platform.extensions.find(kSharingExtension) != std::string::npos;
        const bool known =
            std::find(vendors.begin(), vendors.end(), platform.vendor) != vendors.end();
        if (shares && !known)
            vendors.push_back(platform.vendor);
    }
    return vendors;
}

} // namespace

std::vector<OpenCLPlatform> openCLPlatforms(const OpenCLFunctions& cl)
{
    cl_uint count = 0;
    if (cl.clGetPlatformIDs(0, nullptr, &count) != CL_SUCCESS || count == 0)
        return {};
    std::vector<cl_platform_id> ids(count);
    if (cl.clGetPlatformIDs(count, ids.data(), nullptr) != CL_SUCCESS)
        return {};
    std::vector<OpenCLPlatform> platforms;
    platforms.reserve(count);
    for (cl_platform_id id : ids)
        platforms.push_back({platformText(cl, id, CL_PLATFORM_VENDOR),
                             platformText(cl, id, CL_PLATFORM_EXTENSIONS)});
    return platforms;
}

Result<std::string> sharingVendor(const std::vector<OpenCLPlatform>& platforms)
{
    if (platforms.empty())
        return Failure{ExitCode::kNoOpenCL,
                       "OpenCL has no platform on this machine; install an OpenCL driver (on "
                       "Debian without a GPU: pocl-opencl-icd), or use --allow-cpu"};
    const std::vector<std::string> vendors = vendorsThatShare(platforms);
    if (vendors.empty())
        return Failure{ExitCode::kNoOpenCL,
                       std::string("no OpenCL platform offers ") + kSharingExtension +
                           "; use a GPU whose driver does, set OPENCL_LAYERS to the path of "
                           "libglshare.so, or use --allow-cpu"};
    if (vendors.size() > 1)
        return Failure{ExitCode::kNoOpenCL, "several OpenCL platforms share with OpenGL; choose "
                                            "one with --platform: " +
                                                quotedList(vendors)};
    return vendors.front();
}

} // namespace viewer
