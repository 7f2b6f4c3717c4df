#include "Runtime.h"

#include "runtime/TopenCLInfo.h"
#include "standalone/NativeContext.h"

#include <stdexcept>

namespace {

std::string platformText(cl_platform_id platform, cl_platform_info name)
{
    std::size_t size = 0;
    clGetPlatformInfo(platform, name, 0, nullptr, &size);
    std::string text(size, '\0');
    clGetPlatformInfo(platform, name, size, text.data(), nullptr);
    return text.c_str();
}

} // namespace

Runtime::Runtime(int& argumentCount, char** arguments, const BeforeStart& beforeStart)
    : fApplication(argumentCount, arguments)
{
    fSurface.create();
    if (!fContext.create() || !fContext.makeCurrent(&fSurface))
        throw std::runtime_error("no OpenGL context can be made on this display");
    fHost = std::make_unique<GLHost>(fContext);
    void* graphicsContext = nativeContext(fContext);
    if (beforeStart)
        beforeStart(graphicsContext);
    bool started = false;
    fStartTime = timed([&] {
        started = TopenCLInfo::initialize(nullptr, graphicsContext, nullptr, false, false, 0);
    });
    if (!started)
        throw std::runtime_error("the library does not start on this machine's OpenCL");
}

Runtime::~Runtime()
{
    TopenCLInfo::finish();
}

cl_context Runtime::context()
{
    return TopenCLInfo::theOne().openCLContext();
}

cl_device_id Runtime::device()
{
    return TopenCLInfo::theOne().openCLDevice();
}

cl_command_queue Runtime::queue()
{
    return TopenCLInfo::theOne().openCLCommandQueue();
}

std::string Runtime::platformName()
{
    cl_platform_id platform = nullptr;
    clGetDeviceInfo(device(), CL_DEVICE_PLATFORM, sizeof(cl_platform_id), &platform, nullptr);
    return platformText(platform, CL_PLATFORM_NAME) + ", " +
           platformText(platform, CL_PLATFORM_VERSION);
}

std::string Runtime::deviceName()
{
    char text[256] = "";
    clGetDeviceInfo(device(), CL_DEVICE_NAME, sizeof text, text, nullptr);
    return text;
}
