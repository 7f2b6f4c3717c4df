#include "viewer/opencl/OpenCLNames.h"

#include "loader/OpenCLLibraryName.h"

#include <QLibrary>

namespace viewer {

std::string deviceName(cl_device_id device)
{
    // Resolved at run time: the viewer does not link the OpenCL library, so that it can report its
    // absence.
    using GetDeviceInfo = decltype(&::clGetDeviceInfo);
    QLibrary library(kOpenCLLibraryName);
    const auto getInfo = reinterpret_cast<GetDeviceInfo>(library.resolve("clGetDeviceInfo"));
    char name[256] = "";
    if (!getInfo || getInfo(device, CL_DEVICE_NAME, sizeof(name), name, nullptr) != CL_SUCCESS)
        return {};
    return name;
}

const char* nameOf(TopenCLInfo::GraphicsToCLSyncMode mode) noexcept
{
    switch (mode) {
    case TopenCLInfo::kGraphicsToCLImplicit:
        return "1, implicit";
    case TopenCLInfo::kGraphicsToCLExplicit:
        return "2, explicit (fence)";
    case TopenCLInfo::kGraphicsToCLFinish:
        return "3, glFinish";
    }
    return "unknown";
}

const char* nameOf(TopenCLInfo::CLToGraphicsSyncMode mode) noexcept
{
    switch (mode) {
    case TopenCLInfo::kCLToGraphicsImplicit:
        return "1, implicit";
    case TopenCLInfo::kCLToGraphicsEventQuery:
        return "2, event query";
    case TopenCLInfo::kCLToGraphicsSyncObject:
        return "3, sync object";
    case TopenCLInfo::kCLToGraphicsFinish:
        return "4, clFinish";
    }
    return "unknown";
}

} // namespace viewer
