// What the application is told about devices, contexts, objects and commands.
#include "SharingTest.h"

#include <array>

namespace {

using QueriesTest = SharingTest;

bool isWordOf(const std::string& list, const std::string& word)
{
    return (" " + list + " ").find(" " + word + " ") != std::string::npos;
}

TEST_F(QueriesTest, ExtensionsAreAddedToDeviceAndPlatform)
{
    std::size_t size = 0;
    ASSERT_EQ(clGetDeviceInfo(device_, CL_DEVICE_EXTENSIONS, 0, nullptr, &size), CL_SUCCESS);
    std::string text(size, 'x');
    EXPECT_EQ(clGetDeviceInfo(device_, CL_DEVICE_EXTENSIONS, size - 1, text.data(), nullptr),
              CL_INVALID_VALUE);
    ASSERT_EQ(clGetDeviceInfo(device_, CL_DEVICE_EXTENSIONS, size, text.data(), nullptr),
              CL_SUCCESS);
    EXPECT_EQ(text.find('\0'), size - 1);
    text.pop_back();
    for (const std::string& extensions : {text, extensionsOf(platform_)}) {
        EXPECT_TRUE(isWordOf(extensions, "cl_khr_gl_sharing"));
        EXPECT_EQ(isWordOf(extensions, "cl_khr_gl_event"), offersGlEvent());
    }
    EXPECT_TRUE(isWordOf(text, "cl_khr_byte_addressable_store")) << "the device's own are lost";
}

TEST_F(QueriesTest, EveryFunctionIsFoundByName)
{
    const std::array names{"clCreateFromGLBuffer",       "clCreateFromGLTexture",
                           "clCreateFromGLTexture2D",    "clCreateFromGLTexture3D",
                           "clCreateFromGLRenderbuffer", "clGetGLObjectInfo",
                           "clGetGLTextureInfo",         "clEnqueueAcquireGLObjects",
                           "clEnqueueReleaseGLObjects",  "clGetGLContextInfoKHR"};
    for (const char* name : names) {
        EXPECT_NE(clGetExtensionFunctionAddressForPlatform(platform_, name), nullptr) << name;
        EXPECT_NE(clGetExtensionFunctionAddress(name), nullptr) << name;
    }
    const char* ofEvent = "clCreateEventFromGLsyncKHR";
    EXPECT_EQ(clGetExtensionFunctionAddressForPlatform(platform_, ofEvent) != nullptr,
              offersGlEvent());
    EXPECT_EQ(clGetExtensionFunctionAddressForPlatform(platform_, "clNoSuchFunction"), nullptr);
}

TEST_F(QueriesTest, CpuDevicesAreGpusUnlessSwitchedOff)
{
    const bool isDisguised = isOn("GLSHARE_CPU_AS_GPU");
    const cl_device_type shown = isDisguised ? CL_DEVICE_TYPE_GPU : CL_DEVICE_TYPE_CPU;
    const cl_device_type other = isDisguised ? CL_DEVICE_TYPE_CPU : CL_DEVICE_TYPE_GPU;
    cl_device_type type = 0;
    ASSERT_EQ(clGetDeviceInfo(device_, CL_DEVICE_TYPE, sizeof type, &type, nullptr), CL_SUCCESS);
    if (isDisguised)
        EXPECT_EQ(type, shown);
    else
        EXPECT_NE(type & shown, 0U);

    cl_uint count = 0;
    cl_device_id found = nullptr;
    EXPECT_EQ(clGetDeviceIDs(platform_, shown, 1, &found, &count), CL_SUCCESS);
    EXPECT_EQ(found, device_);
    EXPECT_EQ(count, 1U);
    EXPECT_EQ(clGetDeviceIDs(platform_, other, 1, &found, &count), CL_DEVICE_NOT_FOUND);
    EXPECT_EQ(clGetDeviceIDs(platform_, CL_DEVICE_TYPE_DEFAULT, 1, &found, &count), CL_SUCCESS);

    cl_int error = CL_INVALID_VALUE;
    cl_context context =
        clCreateContextFromType(properties(*gl_).data(), shown, nullptr, nullptr, &error);
    ASSERT_EQ(error, CL_SUCCESS);
    const GLuint buffer = makeGlBuffer(numbersFrom(1, 10));
    cl_mem memory = clCreateFromGLBuffer(context, CL_MEM_READ_ONLY, buffer, &error);
    EXPECT_EQ(error, CL_SUCCESS);
    clReleaseMemObject(memory);
    clReleaseContext(context);
    if (isDisguised) {
        EXPECT_EQ(clCreateContextFromType(properties(*gl_).data(), other, nullptr, nullptr, &error),
                  nullptr);
        EXPECT_EQ(error, CL_DEVICE_NOT_FOUND);
    }
}

TEST_F(QueriesTest, GlContextInfoNamesTheDevices)
{
    const auto list = properties(*gl_);
    std::size_t size = 0;
    cl_device_id device = nullptr;
    EXPECT_EQ(clGetGLContextInfoKHR(list.data(), CL_CURRENT_DEVICE_FOR_GL_CONTEXT_KHR,
                                    sizeof(cl_device_id), &device, &size),
              CL_SUCCESS);
    EXPECT_EQ(device, device_);
    EXPECT_EQ(size, sizeof(cl_device_id));
    device = nullptr;
    EXPECT_EQ(clGetGLContextInfoKHR(list.data(), CL_DEVICES_FOR_GL_CONTEXT_KHR,
                                    sizeof(cl_device_id), &device, &size),
              CL_SUCCESS);
    EXPECT_EQ(device, device_);
    EXPECT_EQ(
        clGetGLContextInfoKHR(list.data(), CL_DEVICES_FOR_GL_CONTEXT_KHR, 1, &device, nullptr),
        CL_INVALID_VALUE);
    EXPECT_EQ(clGetGLContextInfoKHR(list.data(), CL_GL_CONTEXT_KHR, sizeof(cl_device_id), &device,
                                    nullptr),
              CL_INVALID_VALUE);
}

TEST_F(QueriesTest, ContextsAndObjectsShowWhatTheApplicationGave)
{
    const auto list = properties(*gl_);
    std::vector<cl_context_properties> seen(list.size());
    std::size_t size = 0;
    EXPECT_EQ(clGetContextInfo(context_, CL_CONTEXT_PROPERTIES,
                               seen.size() * sizeof(cl_context_properties), seen.data(), &size),
              CL_SUCCESS);
    EXPECT_EQ(size, list.size() * sizeof(cl_context_properties));
    EXPECT_EQ(seen, list);

    const GLuint buffer = makeGlBuffer(numbersFrom(1, 10));
    cl_mem memory = share(buffer, CL_MEM_READ_ONLY);
    cl_gl_object_type type = 0;
    cl_GLuint name = 0;
    EXPECT_EQ(clGetGLObjectInfo(memory, &type, &name), CL_SUCCESS);
    EXPECT_EQ(type, static_cast<cl_gl_object_type>(CL_GL_OBJECT_BUFFER));
    EXPECT_EQ(name, buffer);
    cl_mem_flags flags = 0;
    void* host = &flags;
    std::size_t bytes = 0;
    clGetMemObjectInfo(memory, CL_MEM_FLAGS, sizeof flags, &flags, nullptr);
    clGetMemObjectInfo(memory, CL_MEM_HOST_PTR, sizeof host, static_cast<void*>(&host), nullptr);
    clGetMemObjectInfo(memory, CL_MEM_SIZE, sizeof bytes, &bytes, nullptr);
    EXPECT_EQ(flags, static_cast<cl_mem_flags>(CL_MEM_READ_ONLY));
    EXPECT_EQ(host, nullptr);
    EXPECT_EQ(bytes, 10 * sizeof(cl_int));
    clReleaseMemObject(memory);
}

TEST_F(QueriesTest, EventsNameTheirCommand)
{
    const GLuint buffer = makeGlBuffer(numbersFrom(1, 10));
    cl_mem memory = share(buffer);
    std::array<cl_event, 2> events{};
    EXPECT_EQ(acquire(memory, {}, &events[0]), CL_SUCCESS);
    EXPECT_EQ(release(memory, {}, &events[1]), CL_SUCCESS);
    clFinish(queue_);
    const std::array<cl_command_type, 2> expected{CL_COMMAND_ACQUIRE_GL_OBJECTS,
                                                  CL_COMMAND_RELEASE_GL_OBJECTS};
    for (std::size_t i = 0; i < events.size(); ++i) {
        clRetainEvent(events.at(i));
        clReleaseEvent(events.at(i));
        cl_command_type type = 0;
        cl_command_queue queue = nullptr;
        clGetEventInfo(events.at(i), CL_EVENT_COMMAND_TYPE, sizeof type, &type, nullptr);
        clGetEventInfo(events.at(i), CL_EVENT_COMMAND_QUEUE, sizeof(cl_command_queue),
                       static_cast<void*>(&queue), nullptr);
        EXPECT_EQ(type, expected.at(i));
        EXPECT_EQ(queue, queue_);
        clReleaseEvent(events.at(i));
    }
    clReleaseMemObject(memory);
}

} // namespace
