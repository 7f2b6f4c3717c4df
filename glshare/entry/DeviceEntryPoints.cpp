// Implements the platform and device queries of EntryPoints.h.
#include "core/api/Arguments.h"
#include "core/api/Devices.h"
#include "entry/EntryPoints.h"

#include <algorithm>
#include <array>
#include <cstring>
#include <functional>
#include <string>
#include <vector>

namespace glshare::entry {

namespace {

// The implemented version of each extension: 1.0.0.
constexpr cl_version kExtensionVersion = CL_MAKE_VERSION(1, 0, 0);

// An information query of the runtime, with its object and name bound.
using RuntimeQuery = std::function<cl_int(std::size_t size, void* value, std::size_t* sizeNeeded)>;

[[nodiscard]] cl_int writeExtensions(const RuntimeQuery& query, const InfoOutput& output)
{
    std::size_t size = 0;
    if (const cl_int error = query(0, nullptr, &size); error != CL_SUCCESS)
        return error;
    std::string extensions(size, '\0');
    if (const cl_int error = query(size, extensions.data(), nullptr); error != CL_SUCCESS)
        return error;
    const std::string reported = reportedExtensions(extensions.c_str());
    return writeInfo(std::as_bytes(std::span(reported.c_str(), reported.size() + 1)), output);
}

[[nodiscard]] cl_int writeVersionedExtensions(const RuntimeQuery& query, const InfoOutput& output)
{
    std::size_t size = 0;
    if (const cl_int error = query(0, nullptr, &size); error != CL_SUCCESS)
        return error;
    std::vector<cl_name_version> list(size / sizeof(cl_name_version));
    if (const cl_int error = query(size, list.data(), nullptr); error != CL_SUCCESS)
        return error;
    const std::string_view first = addedExtensions().front();
    const bool isListed = std::ranges::any_of(
        list, [&](const cl_name_version& extension) { return first == extension.name; });
    if (!isListed) {
        for (const std::string_view name : addedExtensions()) {
            cl_name_version extension{kExtensionVersion, {}};
            std::ranges::copy(name, std::begin(extension.name));
            list.push_back(extension);
        }
    }
    return writeInfo(std::as_bytes(std::span(list)), output);
}

} // namespace

cl_int CL_API_CALL getPlatformInfo(cl_platform_id platform, cl_platform_info name, std::size_t size,
                                   void* value, std::size_t* sizeNeeded)
{
    const auto query = [=](std::size_t bytes, void* result, std::size_t* needed) {
        return runtime().clGetPlatformInfo(platform, name, bytes, result, needed);
    };
    switch (name) {
    case CL_PLATFORM_EXTENSIONS:
        return writeExtensions(query, {size, value, sizeNeeded});
    case CL_PLATFORM_EXTENSIONS_WITH_VERSION:
        return writeVersionedExtensions(query, {size, value, sizeNeeded});
    default:
        return query(size, value, sizeNeeded);
    }
}

cl_int CL_API_CALL getDeviceIds(cl_platform_id platform, cl_device_type type, cl_uint capacity,
                                cl_device_id* devices, cl_uint* count)
{
    if (const auto typeForRuntime = runtimeTypeFor(type))
        return runtime().clGetDeviceIDs(platform, *typeForRuntime, capacity, devices, count);
    // No device can match. The runtime checks the other arguments first.
    cl_device_id unusedDevice = nullptr;
    cl_uint unusedCount = 0;
    const cl_int error = runtime().clGetDeviceIDs(
        platform, CL_DEVICE_TYPE_ALL, std::min(capacity, cl_uint{1}),
        devices == nullptr ? nullptr : &unusedDevice, count == nullptr ? nullptr : &unusedCount);
    if (error == CL_SUCCESS && count != nullptr)
        *count = 0;
    return error == CL_SUCCESS ? CL_DEVICE_NOT_FOUND : error;
}

cl_int CL_API_CALL getDeviceInfo(cl_device_id device, cl_device_info name, std::size_t size,
                                 void* value, std::size_t* sizeNeeded)
{
    const auto query = [=](std::size_t bytes, void* result, std::size_t* needed) {
        return runtime().clGetDeviceInfo(device, name, bytes, result, needed);
    };
    switch (name) {
    case CL_DEVICE_TYPE: {
        cl_device_type type = 0;
        const cl_int error = query(sizeof type, &type, nullptr);
        return error != CL_SUCCESS ? error
                                   : writeInfoValue(reportedType(type), {size, value, sizeNeeded});
    }
    case CL_DEVICE_EXTENSIONS:
        return writeExtensions(query, {size, value, sizeNeeded});
    case CL_DEVICE_EXTENSIONS_WITH_VERSION:
        return writeVersionedExtensions(query, {size, value, sizeNeeded});
    default:
        return query(size, value, sizeNeeded);
    }
}

} // namespace glshare::entry
