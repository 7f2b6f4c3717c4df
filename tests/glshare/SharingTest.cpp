#include "SharingTest.h"

#include <cstdlib>
#include <numeric>
#include <string_view>
#include <thread>

Numbers numbersFrom(cl_int first, std::size_t count)
{
    Numbers numbers(count);
    std::iota(numbers.begin(), numbers.end(), first);
    return numbers;
}

void SharingTest::SetUp()
{
    if (EglTestContext::display() == EGL_NO_DISPLAY)
        GTEST_SKIP() << "EGL has no display without a window system here";
    gl_ = std::make_unique<EglTestContext>();
    if (!gl_->valid())
        GTEST_SKIP() << "no OpenGL 4.5 here";
    if (clGetPlatformIDs(1, &platform_, nullptr) != CL_SUCCESS)
        GTEST_SKIP() << "no OpenCL runtime here";
    ASSERT_NE(extensionsOf(platform_).find("cl_khr_gl_sharing"), std::string::npos)
        << "the layer is not active";
    ASSERT_EQ(clGetDeviceIDs(platform_, CL_DEVICE_TYPE_ALL, 1, &device_, nullptr), CL_SUCCESS);
    gl_->makeCurrent();
    cl_int error = CL_SUCCESS;
    context_ = clCreateContext(properties(*gl_).data(), 1, &device_, nullptr, nullptr, &error);
    ASSERT_EQ(error, CL_SUCCESS);
    queue_ = clCreateCommandQueue(context_, device_, 0, &error);
    ASSERT_EQ(error, CL_SUCCESS);
}

void SharingTest::TearDown()
{
    if (queue_ != nullptr)
        clReleaseCommandQueue(queue_);
    if (context_ != nullptr)
        clReleaseContext(context_);
}

bool SharingTest::isOn(const char* variable)
{
    const char* value = std::getenv(variable);
    return value == nullptr || std::string_view(value) != "0";
}

std::string SharingTest::extensionsOf(cl_platform_id platform)
{
    std::size_t size = 0;
    clGetPlatformInfo(platform, CL_PLATFORM_EXTENSIONS, 0, nullptr, &size);
    std::string text(size, '\0');
    clGetPlatformInfo(platform, CL_PLATFORM_EXTENSIONS, size, text.data(), nullptr);
    return text.c_str();
}

glshare_counters SharingTest::counters()
{
    cl_platform_id platform = nullptr;
    clGetPlatformIDs(1, &platform, nullptr);
    const auto getCounters = reinterpret_cast<glshare_get_counters_fn>(
        clGetExtensionFunctionAddressForPlatform(platform, GLSHARE_GET_COUNTERS_NAME));
    glshare_counters result{};
    if (getCounters == nullptr)
        ADD_FAILURE() << "the layer offers no counters";
    else
        getCounters(&result);
    return result;
}

std::vector<cl_context_properties> SharingTest::properties(const EglTestContext& gl) const
{
    return {CL_CONTEXT_PLATFORM,
            reinterpret_cast<cl_context_properties>(platform_),
            CL_GL_CONTEXT_KHR,
            reinterpret_cast<cl_context_properties>(gl.handle()),
            CL_EGL_DISPLAY_KHR,
            reinterpret_cast<cl_context_properties>(EglTestContext::display()),
            0};
}

GLuint SharingTest::makeGlBuffer(const Numbers& numbers)
{
    GLuint buffer = 0;
    glGenBuffers(1, &buffer);
    glBindBuffer(GL_ARRAY_BUFFER, buffer);
    glBufferData(GL_ARRAY_BUFFER, static_cast<GLsizeiptr>(numbers.size() * sizeof(cl_int)),
                 numbers.data(), GL_DYNAMIC_DRAW);
    return buffer;
}

Numbers SharingTest::readGl(GLuint buffer, std::size_t count)
{
    Numbers numbers(count);
    glBindBuffer(GL_ARRAY_BUFFER, buffer);
    glGetBufferSubData(GL_ARRAY_BUFFER, 0, static_cast<GLsizeiptr>(count * sizeof(cl_int)),
                       numbers.data());
    return numbers;
}

cl_mem SharingTest::share(GLuint buffer, cl_mem_flags flags)
{
    cl_int error = CL_SUCCESS;
    cl_mem memory = clCreateFromGLBuffer(context_, flags, buffer, &error);
    EXPECT_EQ(error, CL_SUCCESS);
    EXPECT_NE(memory, nullptr);
    return memory;
}

cl_int SharingTest::acquire(cl_mem memory, const std::vector<cl_event>& waitList, cl_event* event)
{
    return clEnqueueAcquireGLObjects(queue_, 1, &memory, static_cast<cl_uint>(waitList.size()),
                                     waitList.empty() ? nullptr : waitList.data(), event);
}

cl_int SharingTest::release(cl_mem memory, const std::vector<cl_event>& waitList, cl_event* event)
{
    return clEnqueueReleaseGLObjects(queue_, 1, &memory, static_cast<cl_uint>(waitList.size()),
                                     waitList.empty() ? nullptr : waitList.data(), event);
}

Numbers SharingTest::readCl(cl_mem memory, std::size_t count)
{
    Numbers numbers(count);
    EXPECT_EQ(clEnqueueReadBuffer(queue_, memory, CL_TRUE, 0, count * sizeof(cl_int),
                                  numbers.data(), 0, nullptr, nullptr),
              CL_SUCCESS);
    return numbers;
}

void SharingTest::writeCl(cl_mem memory, const Numbers& numbers)
{
    EXPECT_EQ(clEnqueueWriteBuffer(queue_, memory, CL_TRUE, 0, numbers.size() * sizeof(cl_int),
                                   numbers.data(), 0, nullptr, nullptr),
              CL_SUCCESS);
}

cl_int SharingTest::statusOf(cl_event event)
{
    cl_int status = CL_QUEUED;
    EXPECT_EQ(
        clGetEventInfo(event, CL_EVENT_COMMAND_EXECUTION_STATUS, sizeof status, &status, nullptr),
        CL_SUCCESS);
    return status;
}

void SharingTest::onOtherThread(const std::function<void()>& work)
{
    std::thread thread(work);
    thread.join();
}
