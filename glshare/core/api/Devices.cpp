#include "core/api/Devices.h"

#include "core/api/Settings.h"

namespace glshare {

namespace {

constexpr std::string_view kGlSharing = "cl_khr_gl_sharing";
constexpr std::string_view kGlEvent = "cl_khr_gl_event";

// Returns the devices of a context; empty if it is not a valid context.
std::vector<cl_device_id> devicesOf(cl_context context)
{
    std::size_t size = 0;
    if (context == nullptr ||
        runtime().clGetContextInfo(context, CL_CONTEXT_DEVICES, 0, nullptr, &size) != CL_SUCCESS)
        return {};
    std::vector<cl_device_id> devices(size / sizeof(cl_device_id));
    runtime().clGetContextInfo(context, CL_CONTEXT_DEVICES, size, devices.data(), nullptr);
    return devices;
}

} // namespace

bool sharesNatively(cl_device_id device)
{
    std::size_t size = 0;
    if (runtime().clGetDeviceInfo(device, CL_DEVICE_EXTENSIONS, 0, nullptr, &size) != CL_SUCCESS)
        return false;
    std::string extensions(size, '\0');
    runtime().clGetDeviceInfo(device, CL_DEVICE_EXTENSIONS, size, extensions.data(), nullptr);
    return containsExtension(extensions.c_str(), kGlSharing);
}

bool runtimeSharesNatively(cl_context context)
{
    const std::vector<cl_device_id> devices = devicesOf(context);
    return !devices.empty() && sharesNatively(devices.front());
}

bool supportsOpenCl3(cl_context context)
{
    const std::vector<cl_device_id> devices = devicesOf(context);
    cl_platform_id platform = nullptr;
    cl_version version = 0; // a query of OpenCL 3.0
    return !devices.empty() &&
           runtime().clGetDeviceInfo(devices.front(), CL_DEVICE_PLATFORM, sizeof platform,
                                     static_cast<void*>(&platform), nullptr) == CL_SUCCESS &&
           runtime().clGetPlatformInfo(platform, CL_PLATFORM_NUMERIC_VERSION, sizeof version,
                                       &version, nullptr) == CL_SUCCESS &&
           CL_VERSION_MAJOR(version) >= 3;
}

cl_device_type runtimeType(cl_device_id device)
{
    cl_device_type type = 0;
    runtime().clGetDeviceInfo(device, CL_DEVICE_TYPE, sizeof type, &type, nullptr);
    return type;
}

cl_device_type reportedType(cl_device_type type)
{
    const bool isReportedAsGpu = settings().cpuAsGpu && (type & CL_DEVICE_TYPE_CPU) != 0;
    return isReportedAsGpu ? cl_device_type{CL_DEVICE_TYPE_GPU} : type;
}

std::optional<cl_device_type> runtimeTypeFor(cl_device_type requested)
{
    if (!settings().cpuAsGpu || requested == CL_DEVICE_TYPE_ALL)
        return requested;
    const bool includesGpu = (requested & CL_DEVICE_TYPE_GPU) != 0;
    const cl_device_type others = requested & ~cl_device_type{CL_DEVICE_TYPE_CPU};
    const cl_device_type type = includesGpu ? others | CL_DEVICE_TYPE_CPU : others;
    if (type == 0 && requested != 0)
        return std::nullopt;
    return type;
}

std::vector<cl_device_id> devicesOf(cl_platform_id platform, cl_device_type requested)
{
    const std::optional<cl_device_type> type = runtimeTypeFor(requested);
    cl_uint count = 0;
    if (!type || runtime().clGetDeviceIDs(platform, *type, 0, nullptr, &count) != CL_SUCCESS)
        return {};
    std::vector<cl_device_id> devices(count);
    if (runtime().clGetDeviceIDs(platform, *type, count, devices.data(), nullptr) != CL_SUCCESS)
        return {};
    return devices;
}

cl_platform_id platformOrFirst(cl_platform_id platform)
{
    if (platform == nullptr)
        runtime().clGetPlatformIDs(1, &platform, nullptr);
    return platform;
}

namespace {

std::vector<std::string_view>& extensionsToAdd()
{
    static auto theExtensions = settings().glEvent
                                    ? std::vector<std::string_view>{kGlSharing, kGlEvent}
                                    : std::vector<std::string_view>{kGlSharing};
    return theExtensions;
}

} // namespace

const std::vector<std::string_view>& addedExtensions()
{
    return extensionsToAdd();
}

void addExtension(std::string_view name)
{
    extensionsToAdd().push_back(name);
}

bool containsExtension(std::string_view extensions, std::string_view name) noexcept
{
    while (!extensions.empty()) {
        const std::size_t end = extensions.find(' ');
        if (extensions.substr(0, end) == name)
            return true;
        if (end == std::string_view::npos)
            return false;
        extensions.remove_prefix(end + 1);
    }
    return false;
}

std::string reportedExtensions(std::string extensions)
{
    if (containsExtension(extensions, kGlSharing))
        return extensions;
    for (const std::string_view added : addedExtensions()) {
        if (!extensions.empty() && extensions.back() != ' ')
            extensions += ' ';
        extensions += added;
    }
    return extensions;
}

} // namespace glshare
