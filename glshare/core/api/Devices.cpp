#include "core/api/Devices.h"

#include "core/api/Switches.h"

namespace glshare {

namespace {

constexpr std::string_view kSharing = "cl_khr_gl_sharing";
constexpr std::string_view kEvent = "cl_khr_gl_event";

// Empty if `context` is not a context.
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

bool sharesByItself(cl_device_id device)
{
    std::size_t size = 0;
    if (runtime().clGetDeviceInfo(device, CL_DEVICE_EXTENSIONS, 0, nullptr, &size) != CL_SUCCESS)
        return false;
    std::string extensions(size, '\0');
    runtime().clGetDeviceInfo(device, CL_DEVICE_EXTENSIONS, size, extensions.data(), nullptr);
    return containsExtension(extensions.c_str(), kSharing);
}

bool runtimeShares(cl_context context)
{
    const std::vector<cl_device_id> devices = devicesOf(context);
    return !devices.empty() && sharesByItself(devices.front());
}

bool offersVersion3(cl_context context)
{
    const std::vector<cl_device_id> devices = devicesOf(context);
    cl_platform_id platform = nullptr;
    cl_version version = 0; // a query that OpenCL 3.0 has introduced
    return !devices.empty() &&
           runtime().clGetDeviceInfo(devices.front(), CL_DEVICE_PLATFORM, sizeof platform,
                                     static_cast<void*>(&platform), nullptr) == CL_SUCCESS &&
           runtime().clGetPlatformInfo(platform, CL_PLATFORM_NUMERIC_VERSION, sizeof version,
                                       &version, nullptr) == CL_SUCCESS &&
           CL_VERSION_MAJOR(version) >= 3;
}

cl_device_type ownType(cl_device_id device)
{
    cl_device_type type = 0;
    runtime().clGetDeviceInfo(device, CL_DEVICE_TYPE, sizeof type, &type, nullptr);
    return type;
}

cl_device_type shownType(cl_device_type own)
{
    const bool isDisguised = switches().cpuAsGpu && (own & CL_DEVICE_TYPE_CPU) != 0;
    return isDisguised ? cl_device_type{CL_DEVICE_TYPE_GPU} : own;
}

std::optional<cl_device_type> typeToAskFor(cl_device_type wanted)
{
    if (!switches().cpuAsGpu || wanted == CL_DEVICE_TYPE_ALL)
        return wanted;
    const bool wantsGpu = (wanted & CL_DEVICE_TYPE_GPU) != 0;
    const cl_device_type others = wanted & ~cl_device_type{CL_DEVICE_TYPE_CPU};
    const cl_device_type asked = wantsGpu ? others | CL_DEVICE_TYPE_CPU : others;
    if (asked == 0 && wanted != 0)
        return std::nullopt;
    return asked;
}

std::vector<cl_device_id> devicesOf(cl_platform_id platform, cl_device_type wanted)
{
    const std::optional<cl_device_type> type = typeToAskFor(wanted);
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
    static auto theExtensions = switches().glEvent ? std::vector<std::string_view>{kSharing, kEvent}
                                                   : std::vector<std::string_view>{kSharing};
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

bool containsExtension(std::string_view extensions, std::string_view name)
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

std::string shownExtensions(std::string own)
{
    if (containsExtension(own, kSharing))
        return own;
    for (const std::string_view extension : addedExtensions()) {
        if (!own.empty() && own.back() != ' ')
            own += ' ';
        own += extension;
    }
    return own;
}

} // namespace glshare
