#include "startup/Startup.h"

#include "host/GLDisplay.h"

#include <array>
#include <stdexcept>
#include <vector>

#include <CL/cl.h>
#include <CL/cl_gl.h>

namespace {

struct Started {
    cl_context context = nullptr;
    std::array<cl_command_queue, 2> queues{};

    Started() = default;
    ~Started()
    {
        for (cl_command_queue queue : queues)
            clReleaseCommandQueue(queue);
        clReleaseContext(context);
    }
    Started(const Started&) = delete;
    Started& operator=(const Started&) = delete;
};

void queryPlatform(cl_platform_id platform)
{
    constexpr cl_platform_info kQueries[] = {CL_PLATFORM_NAME, CL_PLATFORM_VENDOR,
                                             CL_PLATFORM_VERSION, CL_PLATFORM_EXTENSIONS};
    for (const cl_platform_info name : kQueries) {
        std::size_t size = 0;
        clGetPlatformInfo(platform, name, 0, nullptr, &size);
        std::vector<char> text(size);
        clGetPlatformInfo(platform, name, size, text.data(), nullptr);
    }
}

void start(Started& started, void* graphicsContext)
{
    cl_uint count = 0;
    clGetPlatformIDs(0, nullptr, &count);
    std::vector<cl_platform_id> platforms(count);
    clGetPlatformIDs(count, platforms.data(), nullptr);
    if (platforms.empty())
        throw std::runtime_error("there is no OpenCL platform");
    for (cl_platform_id platform : platforms)
        queryPlatform(platform);

    const GLDisplayProperty display = glDisplayProperty(nullptr);
    const std::array<cl_context_properties, 7> properties{
        CL_CONTEXT_PLATFORM,
        reinterpret_cast<cl_context_properties>(platforms.front()),
        CL_GL_CONTEXT_KHR,
        reinterpret_cast<cl_context_properties>(graphicsContext),
        display.name,
        display.value,
        0};
    const auto queryDevice = reinterpret_cast<clGetGLContextInfoKHR_fn>(
        clGetExtensionFunctionAddressForPlatform(platforms.front(), "clGetGLContextInfoKHR"));
    cl_device_id device = nullptr;
    if (!queryDevice || queryDevice(properties.data(), CL_CURRENT_DEVICE_FOR_GL_CONTEXT_KHR,
                                    sizeof(cl_device_id), &device, nullptr) != CL_SUCCESS)
        throw std::runtime_error("no device shares with this OpenGL context");

    cl_int status = CL_SUCCESS;
    started.context = clCreateContext(properties.data(), 1, &device, nullptr, nullptr, &status);
    for (cl_command_queue& queue : started.queues)
        queue = clCreateCommandQueue(started.context, device, 0, &status);
    if (status != CL_SUCCESS)
        throw std::runtime_error("no context or queue can be created");
}

} // namespace

Nanoseconds startDirectly(void* graphicsContext)
{
    Started started;
    return timed([&] { start(started, graphicsContext); });
}
