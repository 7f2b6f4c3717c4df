// Implements the platform and device queries of EntryPoints.h.
#include "core/api/Answer.h"
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

// Version 1.0.0 of an extension, as this program implements both.
constexpr cl_version kExtensionVersion = CL_MAKE_VERSION(1, 0, 0);

// One information query of the runtime's, of an object that is already chosen.
using OwnQuery = std::function<cl_int(std::size_t size, void* value, std::size_t* sizeNeeded)>;

cl_int answerExtensions(const OwnQuery& own, const Query& query)
{
    std::size_t size = 0;
    if (const cl_int error = own(0, nullptr, &size); error != CL_SUCCESS)
        return error;
    std::string extensions(size, '\0');
    if (const cl_int error = own(size, extensions.data(), nullptr); error != CL_SUCCESS)
        return error;
    const std::string shown = shownExtensions(extensions.c_str());
    return answer(std::as_bytes(std::span(shown.c_str(), shown.size() + 1)), query);
}

cl_int answerVersionedExtensions(const OwnQuery& own, const Query& query)
{
    std::size_t size = 0;
    if (const cl_int error = own(0, nullptr, &size); error != CL_SUCCESS)
        return error;
    std::vector<cl_name_version> list(size / sizeof(cl_name_version));
    if (const cl_int error = own(size, list.data(), nullptr); error != CL_SUCCESS)
        return error;
    const std::string_view first = addedExtensions().front();
    const bool isThere = std::ranges::any_of(
        list, [&](const cl_name_version& extension) { return first == extension.name; });
    if (!isThere) {
        for (const std::string_view name : addedExtensions()) {
            cl_name_version extension{kExtensionVersion, {}};
            std::ranges::copy(name, std::begin(extension.name));
            list.push_back(extension);
        }
    }
    return answer(std::as_bytes(std::span(list)), query);
}

} // namespace

cl_int CL_API_CALL getPlatformInfo(cl_platform_id platform, cl_platform_info name, std::size_t size,
                                   void* value, std::size_t* sizeNeeded)
{
    const auto own = [=](std::size_t ownSize, void* ownValue, std::size_t* ownNeeded) {
        return runtime().clGetPlatformInfo(platform, name, ownSize, ownValue, ownNeeded);
    };
    switch (name) {
    case CL_PLATFORM_EXTENSIONS:
        return answerExtensions(own, {size, value, sizeNeeded});
    case CL_PLATFORM_EXTENSIONS_WITH_VERSION:
        return answerVersionedExtensions(own, {size, value, sizeNeeded});
    default:
        return own(size, value, sizeNeeded);
    }
}

cl_int CL_API_CALL getDeviceIds(cl_platform_id platform, cl_device_type type, cl_uint capacity,
                                cl_device_id* devices, cl_uint* count)
{
    if (const auto asked = typeToAskFor(type))
        return runtime().clGetDeviceIDs(platform, *asked, capacity, devices, count);
    // No device can match, which counts only if the runtime accepts the other arguments.
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
    const auto own = [=](std::size_t ownSize, void* ownValue, std::size_t* ownNeeded) {
        return runtime().clGetDeviceInfo(device, name, ownSize, ownValue, ownNeeded);
    };
    switch (name) {
    case CL_DEVICE_TYPE: {
        cl_device_type type = 0;
        const cl_int error = own(sizeof type, &type, nullptr);
        return error != CL_SUCCESS ? error : answerWith(shownType(type), {size, value, sizeNeeded});
    }
    case CL_DEVICE_EXTENSIONS:
        return answerExtensions(own, {size, value, sizeNeeded});
    case CL_DEVICE_EXTENSIONS_WITH_VERSION:
        return answerVersionedExtensions(own, {size, value, sizeNeeded});
    default:
        return own(size, value, sizeNeeded);
    }
}

} // namespace glshare::entry
