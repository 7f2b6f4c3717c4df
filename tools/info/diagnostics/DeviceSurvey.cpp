#include "tools/info/diagnostics/DeviceSurvey.h"

#include "loader/OpenCLLibraryName.h"
#include "loader/OpenCLLoader.h"
#include "loader/SharedLibrary.h"
#include "runtime/DeviceSelection.h"
#include "runtime/TopenCLInfo.h"
#include "tools/info/diagnostics/RenderWindow.h"

#include <algorithm>
#include <array>

namespace info {
namespace {

// The native window counts only on Windows.
constexpr void* kNoWindow = nullptr;

// Above the number of devices on one platform of any machine.
constexpr std::size_t kMaximumDevices = 64;

// The ids of a platform's devices, and those of them that share with the OpenGL context.
struct DeviceIds {
    std::vector<cl_device_id> all;
    std::vector<cl_device_id> sharing;
    cl_device_id current = nullptr;
};

bool contains(const std::vector<cl_device_id>& ids, cl_device_id id)
{
    return std::find(ids.begin(), ids.end(), id) != ids.end();
}

// The library does not call clGetDeviceIDs, so its table has no entry for it.
decltype(&::clGetDeviceIDs) findGetDeviceIDs()
{
    void* library = openSharedLibrary(kOpenCLLibraryName);
    return library ? reinterpret_cast<decltype(&::clGetDeviceIDs)>(
                         findSymbol(library, "clGetDeviceIDs"))
                   : nullptr;
}

std::vector<cl_device_id> allDevices(cl_platform_id platform)
{
    const auto getDeviceIDs = findGetDeviceIDs();
    cl_uint count = 0;
    if (!getDeviceIDs ||
        getDeviceIDs(platform, CL_DEVICE_TYPE_ALL, 0, nullptr, &count) != CL_SUCCESS)
        return {};
    std::vector<cl_device_id> ids(count);
    if (count > 0)
        getDeviceIDs(platform, CL_DEVICE_TYPE_ALL, count, ids.data(), nullptr);
    return ids;
}

// Makes the queries by which start-up finds the device. Returns the status of the first that fails.
int querySharingDevices(cl_platform_id platform, RenderWindow& window, DeviceIds& ids)
{
    if (!ocl.clGetGLContextInfoKHR || !window.renderer().usable)
        return CL_SUCCESS;
    const ContextProperties properties =
        openGLContextProperties(kNoWindow, window.nativeContext(), platform);
    std::array<cl_device_id, kMaximumDevices> list{};
    std::size_t bytes = 0;
    int status = ocl.clGetGLContextInfoKHR(properties.data(), CL_DEVICES_FOR_GL_CONTEXT_KHR,
                                           sizeof list, list.data(), &bytes);
    if (status != CL_SUCCESS)
        return status;
    const std::size_t count = std::min(bytes / sizeof(cl_device_id), list.size());
    ids.sharing.assign(list.begin(), list.begin() + static_cast<std::ptrdiff_t>(count));
    return ocl.clGetGLContextInfoKHR(properties.data(), CL_CURRENT_DEVICE_FOR_GL_CONTEXT_KHR,
                                     sizeof(cl_device_id), &ids.current, nullptr);
}

std::string deviceText(cl_device_id device, cl_device_info name)
{
    std::size_t size = 0;
    if (ocl.clGetDeviceInfo(device, name, 0, nullptr, &size) != CL_SUCCESS)
        return "";
    std::string text(size, '\0');
    if (ocl.clGetDeviceInfo(device, name, size, text.data(), nullptr) != CL_SUCCESS)
        return "";
    text.resize(std::min(text.find('\0'), text.size()));
    return text;
}

template <typename Value>
std::optional<Value> deviceValue(cl_device_id device, cl_device_info name)
{
    Value value{};
    const int status = ocl.clGetDeviceInfo(device, name, sizeof value, &value, nullptr);
    return status == CL_SUCCESS ? std::optional<Value>(value) : std::nullopt;
}

Device describeDevice(cl_device_id id)
{
    Device device;
    device.name = deviceText(id, CL_DEVICE_NAME);
    device.vendor = deviceText(id, CL_DEVICE_VENDOR);
    device.version = deviceText(id, CL_DEVICE_VERSION);
    device.driverVersion = deviceText(id, CL_DRIVER_VERSION);
    device.extensions = deviceText(id, CL_DEVICE_EXTENSIONS);
    device.type = deviceValue<cl_device_type>(id, CL_DEVICE_TYPE).value_or(0);
    device.vendorId = deviceValue<cl_uint>(id, CL_DEVICE_VENDOR_ID);
    device.available = deviceValue<cl_bool>(id, CL_DEVICE_AVAILABLE).value_or(CL_FALSE) != CL_FALSE;
    device.doublePrecision =
        deviceValue<cl_device_fp_config>(id, CL_DEVICE_DOUBLE_FP_CONFIG).value_or(0) != 0;
    device.computeUnits = deviceValue<cl_uint>(id, CL_DEVICE_MAX_COMPUTE_UNITS).value_or(0);
    return device;
}

} // namespace

void surveyDevices(cl_platform_id id, RenderWindow& window, Platform& platform)
{
    DeviceIds ids;
    ids.all = allDevices(id);
    // Only on platforms with the extension, since others need not handle the query, and on the
    // chosen one, where start-up has made it.
    if (platform.chosen || listsExtension(platform.extensions, "cl_khr_gl_sharing"))
        platform.sharingStatus = querySharingDevices(id, window, ids);
    for (cl_device_id sharing : ids.sharing) {
        if (!contains(ids.all, sharing))
            ids.all.push_back(sharing);
    }
    const cl_device_id chosen = platform.chosen ? TopenCLInfo::theOne().openCLDevice() : nullptr;
    for (cl_device_id deviceId : ids.all) {
        Device device = describeDevice(deviceId);
        device.sharesWithRenderer = contains(ids.sharing, deviceId);
        device.drivesRenderer = deviceId == ids.current;
        device.chosen = chosen && deviceId == chosen;
        platform.devices.push_back(std::move(device));
    }
}

} // namespace info
