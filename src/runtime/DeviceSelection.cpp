// The choice of the device, and the parts of TopenCLInfo that query its abilities.
#include "runtime/DeviceSelection.h"

#include "diagnostics/CLStatusReport.h"
#include "host/Environment.h"
#include "host/GLDisplay.h"
#include "loader/OpenCLLoader.h"
#include "runtime/DriverVersion.h"
#include "runtime/EnvironmentVariables.h"
#include "runtime/InteropFunctions.h"
#include "runtime/PlatformSelection.h"
#include "runtime/StartUpStep.h"
#include "runtime/TopenCLInfo.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <optional>
#include <string>
#include <vector>

namespace {

// Above the number of devices that share with one renderer on any machine.
constexpr std::size_t kMaximumDevices = 64;
using DeviceList = std::array<cl_device_id, kMaximumDevices>;

// Capacity, in bytes, for a driver version, a device name or a platform version.
using InfoText = std::array<char, 128>;

cl_context_properties asProperty(void* handle)
{
    return reinterpret_cast<cl_context_properties>(handle);
}

// Reads as many bytes as `value` has. Returns false if the query fails, which is reported.
template <typename Value>
bool readDeviceInfo(cl_device_id device, cl_device_info name, Value& value)
{
    return checkStatus(ocl.clGetDeviceInfo(device, name, sizeof value, &value, nullptr),
                       CLReportStyle::kWithLineBreak);
}

// Sets `isGPU` to whether the device's type is GPU and no other. Returns false if the query fails.
bool readIsGPU(cl_device_id device, bool& isGPU)
{
    cl_device_type type = 0;
    if (!readDeviceInfo(device, CL_DEVICE_TYPE, type))
        return false;
    isGPU = type == CL_DEVICE_TYPE_GPU;
    return true;
}

// Reads devices of the OpenGL context into `value`, which has `capacity` bytes. `size` receives the
// number of bytes read. Returns false if the query fails.
bool readGLContextInfo(const ContextProperties& properties, cl_gl_context_info name,
                       std::size_t capacity, void* value, std::size_t& size)
{
    size = 0;
    return checkStatus(ocl.clGetGLContextInfoKHR(properties.data(), name, capacity, value, &size),
                       CLReportStyle::kWithLineBreak);
}

// Chooses `current` if it is a GPU and one of `devices`, else the first GPU of `devices`. `chosen`
// stays null if there is no GPU. Returns false if a query fails.
bool chooseGPU(const DeviceList& devices, std::size_t count, cl_device_id current,
               cl_device_id& chosen)
{
    const auto end = devices.begin() + static_cast<std::ptrdiff_t>(count);
    bool isGPU = false;
    if (current && std::find(devices.begin(), end, current) != end) {
        if (!readIsGPU(current, isGPU))
            return false;
        if (isGPU) {
            chosen = current;
            return true;
        }
    }
    for (auto device = devices.begin(); device != end; ++device) {
        if (!readIsGPU(*device, isGPU))
            return false;
        if (isGPU) {
            chosen = *device;
            return true;
        }
    }
    return true;
}

bool chooseDeviceForOpenGL(const ContextProperties& properties, cl_device_id& device)
{
    // A runtime without the query cannot share with OpenGL at all.
    if (ocl.clGetGLContextInfoKHR) {
        DeviceList devices{};
        std::size_t listBytes = 0;
        cl_device_id current = nullptr;
        std::size_t currentBytes = 0;
        if (!readGLContextInfo(properties, CL_DEVICES_FOR_GL_CONTEXT_KHR, sizeof devices,
                               devices.data(), listBytes) ||
            !readGLContextInfo(properties, CL_CURRENT_DEVICE_FOR_GL_CONTEXT_KHR, sizeof current,
                               &current, currentBytes))
            return false;
        const std::size_t count = std::min(listBytes / sizeof(cl_device_id), devices.size());
        if (!chooseGPU(devices, count, current, device))
            return false;
    }
    if (!device)
        std::fprintf(
            stderr,
            "OpenCL evaluator is unable to find a GPU device that can share VBOs with OpenGL.\n");
    return device != nullptr;
}

bool chooseDeviceForD3D11(void* d3dDevice, cl_platform_id platform, cl_device_id& device)
{
    DeviceList devices{};
    if (!checkStatus(sfGetDeviceIDsFromD3D11(
                         platform, kCLD3D11Device, d3dDevice, kCLPreferredDevicesForD3D11,
                         static_cast<cl_uint>(devices.size()), devices.data(), nullptr),
                     CLReportStyle::kWithLineBreak))
        return false;
    device = devices.front();
    return device != nullptr;
}

std::optional<int> ignoreDriverVersion()
{
    const char* value = std::getenv(kIgnoreDriverVersionVariable);
    return value ? std::optional<int>(std::atoi(value)) : std::nullopt;
}

} // namespace

ContextProperties openGLContextProperties(void* window, void* glContext, cl_platform_id platform)
{
    const GLDisplayProperty display = glDisplayProperty(window);
    return {CL_GL_CONTEXT_KHR, asProperty(glContext), display.name,
            display.value,     CL_CONTEXT_PLATFORM,   asProperty(platform)};
}

ContextProperties d3d11ContextProperties(void* d3dDevice, cl_platform_id platform)
{
    return {kCLContextD3D11Device, asProperty(d3dDevice), CL_CONTEXT_PLATFORM,
            asProperty(platform)};
}

bool chooseDevice(bool usingDX, void* graphicsContext, cl_platform_id platform,
                  const ContextProperties& properties, cl_device_id& device)
{
    enterStartUpStep(StartUpStep::kDevice);
    return usingDX ? chooseDeviceForD3D11(graphicsContext, platform, device)
                   : chooseDeviceForOpenGL(properties, device);
}

bool reportDevice(cl_device_id device)
{
    enterStartUpStep(StartUpStep::kAvailability);
    InfoText name{};
    if (!readDeviceInfo(device, CL_DEVICE_NAME, name))
        return false;
    std::fprintf(stderr, "Choosing OpenCL Device %s.  ", name.data());

    bool isGPU = false;
    if (!readIsGPU(device, isGPU))
        return false;
    std::fprintf(stderr, "Device Type: %s  ", isGPU ? "GPU" : "Non-GPU");

    cl_bool available = CL_FALSE;
    if (!readDeviceInfo(device, CL_DEVICE_AVAILABLE, available))
        return false;
    if (!available) {
        std::fprintf(stderr, "GL shared device is not available, no OpenCL will be used\n");
        return false;
    }
    std::fprintf(stderr, "Device is available.\n");
    return true;
}

bool TopenCLInfo::decideAsyncReadback()
{
    enterStartUpStep(StartUpStep::kDriver);
    if (fProvider == kNVIDIAProvider)
        return judgeNVIDIADriver();
    fSupportsAsyncReadback = fProvider == kIntelProvider || fProvider == kAMDProvider;
    return true;
}

// Returns false if the driver's OpenCL is known to fail, or if the query of its version fails.
bool TopenCLInfo::judgeNVIDIADriver()
{
    InfoText text{};
    if (!readDeviceInfo(fDevice, CL_DRIVER_VERSION, text))
        return false;
    try {
        const DriverVersion version = parseDriverVersion(std::string(text.data()));
        const DriverVerdict verdict = judgeDriver(version, ignoreDriverVersion());
        if (!verdict.usable) {
            std::fprintf(
                stderr,
                "\nOpenCL is not supported by NVidia drivers between version 361.91 and 368.86.  To enabled OpenCL for this driver version set VYRA_OPENCL_IGNORE_DRIVER_VERSION=1.\n");
            return false;
        }
        fDriverSupportsImplicitSync = verdict.implicitSync;
        fSupportsAsyncReadback = verdict.asyncReadback;
    } catch (...) {
        std::fprintf(
            stderr,
            "Unable to detect NVidia driver version.  Disabling asynchronous read-back for OpenCL.\n");
        fSupportsAsyncReadback = false;
    }
    return true;
}

bool TopenCLInfo::decideDoublePrecision(cl_platform_id platform)
{
    enterStartUpStep(StartUpStep::kDoublePrecision);
    InfoText version{};
    if (!checkStatus(ocl.clGetPlatformInfo(platform, CL_PLATFORM_VERSION, sizeof version,
                                           version.data(), nullptr),
                     CLReportStyle::kWithLineBreak))
        return false;

    constexpr std::size_t kVersionPrefix = 10;
    if (std::strncmp(version.data(), "OpenCL 1.0", kVersionPrefix) == 0 ||
        std::strncmp(version.data(), "OpenCL 1.1", kVersionPrefix) == 0) {
        // Before version 1.2 double precision is an extension; a failing query counts as absence.
        std::vector<char> extensions;
        static_cast<void>(queryPlatformInfo(platform, CL_PLATFORM_EXTENSIONS, extensions));
        fPlatformSupportsDoublePrecision = platformText(extensions).findMB("cl_khr_fp64") != -1;
    } else {
        cl_device_fp_config config = 0;
        if (!readDeviceInfo(fDevice, CL_DEVICE_DOUBLE_FP_CONFIG, config))
            return false;
        fPlatformSupportsDoublePrecision = config != 0;
    }

    if (!fPlatformSupportsDoublePrecision &&
        TenvironmentVariable(kOffWithoutDoubleVariable).asInt32(0) != 0) {
        std::fprintf(
            stderr,
            "Vyra OpenCL is not supported on device because double precision is not supported.\n");
        return false;
    }
    return true;
}

bool TopenCLInfo::readComputeUnitCount()
{
    cl_uint count = 0;
    if (!readDeviceInfo(fDevice, CL_DEVICE_MAX_COMPUTE_UNITS, count))
        return false;
    fComputeUnitCount = count;
    return true;
}
