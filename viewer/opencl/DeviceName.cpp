#include "viewer/opencl/DeviceName.h"

#include "loader/OpenCLLibraryName.h"

#include <QLibrary>

namespace viewer {

// Nothing links the OpenCL library, so that the viewer can report its absence in a sentence.
std::string deviceName(cl_device_id device)
{
    using GetDeviceInfo = decltype(&::clGetDeviceInfo);
    QLibrary library(kOpenCLLibraryName);
    const auto getInfo = reinterpret_cast<GetDeviceInfo>(library.resolve("clGetDeviceInfo"));
    char name[256] = "";
    if (!getInfo || getInfo(device, CL_DEVICE_NAME, sizeof(name), name, nullptr) != CL_SUCCESS)
        return {};
    return name;
}

} // namespace viewer
