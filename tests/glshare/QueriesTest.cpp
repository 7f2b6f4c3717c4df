// Information queries of devices, contexts, memory objects and events.
#include "SharingTest.h"

#include <array>
#include <functional>
#include <utility>

namespace {

using QueriesTest = SharingTest;

bool hasExtension(const std::string& list, const std::string& name)
{
    return (" " + list + " ").find(" " + name + " ") != std::string::npos;
}

TEST_F(QueriesTest, DeviceAndPlatformExtensionsListSharing)
{
    std::size_t size = 0;
    clGetDeviceInfo(fDevice, CL_DEVICE_EXTENSIONS, 0, nullptr, &size);
    std::string text(size, 'x');
    clGetDeviceInfo(fDevice, CL_DEVICE_EXTENSIONS, size, text.data(), nullptr);
    EXPECT_EQ(text.find('\0'), size - 1);
    text.pop_back();
    for (const std::string& extensions : {text, extensionsOf(fPlatform)}) {
        EXPECT_TRUE(hasExtension(extensions, "cl_khr_gl_sharing"));
        EXPECT_EQ(hasExtension(extensions, "cl_khr_gl_event"), offersGlEvent());
    }
    EXPECT_TRUE(hasExtension(text, "cl_khr_byte_addressable_store"))
        << "the device's own extensions are missing";
}

TEST_F(QueriesTest, ExtensionFunctionsAreFoundByName)
{
    for (const char* name :
         {"clCreateFromGLBuffer", "clCreateFromGLTexture", "clCreateFromGLTexture2D",
          "clCreateFromGLTexture3D", "clCreateFromGLRenderbuffer", "clGetGLObjectInfo",
          "clGetGLTextureInfo", "clEnqueueAcquireGLObjects", "clEnqueueReleaseGLObjects",
          "clGetGLContextInfoKHR"}) {
        EXPECT_NE(clGetExtensionFunctionAddressForPlatform(fPlatform, name), nullptr) << name;
        EXPECT_NE(clGetExtensionFunctionAddress(name), nullptr) << name;
    }
    const char* ofEvent = "clCreateEventFromGLsyncKHR";
    EXPECT_EQ(clGetExtensionFunctionAddressForPlatform(fPlatform, ofEvent) != nullptr,
              offersGlEvent());
    EXPECT_EQ(clGetExtensionFunctionAddressForPlatform(fPlatform, "clNoSuchFunction"), nullptr);
}

TEST_F(QueriesTest, CpuDevicesReportGpuTypeUnlessDisabled)
{
    const bool isReportedAsGpu = isOn("GLSHARE_CPU_AS_GPU");
    const cl_device_type reported = isReportedAsGpu ? CL_DEVICE_TYPE_GPU : CL_DEVICE_TYPE_CPU;
    const cl_device_type other = isReportedAsGpu ? CL_DEVICE_TYPE_CPU : CL_DEVICE_TYPE_GPU;
    const auto type = infoOf<cl_device_type>(clGetDeviceInfo, fDevice, CL_DEVICE_TYPE);
    EXPECT_EQ(isReportedAsGpu ? type : type & reported, reported);

    cl_uint count = 0;
    cl_device_id found = nullptr;
    EXPECT_EQ(clGetDeviceIDs(fPlatform, reported, 1, &found, &count), CL_SUCCESS);
    EXPECT_EQ(found, fDevice);
    EXPECT_EQ(count, 1U);
    EXPECT_EQ(clGetDeviceIDs(fPlatform, other, 1, &found, &count), CL_DEVICE_NOT_FOUND);
    EXPECT_EQ(clGetDeviceIDs(fPlatform, CL_DEVICE_TYPE_DEFAULT, 1, &found, &count), CL_SUCCESS);

    cl_int error = CL_INVALID_VALUE;
    const Context context =
        clCreateContextFromType(properties().data(), reported, nullptr, nullptr, &error);
    ASSERT_EQ(error, CL_SUCCESS);
    share(context, fBuffer);
    if (isReportedAsGpu) {
        EXPECT_EQ(clCreateContextFromType(properties().data(), other, nullptr, nullptr, &error),
                  nullptr);
        EXPECT_EQ(error, CL_DEVICE_NOT_FOUND);
    }
}

TEST_F(QueriesTest, ContextAndBufferInfoReturnsTheValuesOfTheApplication)
{
    const Properties list = properties();
    Properties seen(list.size());
    EXPECT_EQ(clGetContextInfo(fContext, CL_CONTEXT_PROPERTIES,
                               seen.size() * sizeof(cl_context_properties), seen.data(), nullptr),
              CL_SUCCESS);
    EXPECT_EQ(seen, list);

    for (const cl_gl_context_info name :
         {cl_uint{CL_CURRENT_DEVICE_FOR_GL_CONTEXT_KHR}, cl_uint{CL_DEVICES_FOR_GL_CONTEXT_KHR}})
        EXPECT_EQ(infoOf<cl_device_id>(clGetGLContextInfoKHR, list.data(), name), fDevice);
    EXPECT_EQ(clGetGLContextInfoKHR(list.data(), CL_GL_CONTEXT_KHR, 0, nullptr, nullptr),
              CL_INVALID_VALUE);

    const Memory memory = share(fContext, fBuffer, CL_MEM_READ_ONLY);
    cl_gl_object_type type = 0;
    cl_GLuint name = 0;
    EXPECT_EQ(clGetGLObjectInfo(memory, &type, &name), CL_SUCCESS);
    EXPECT_EQ(type, cl_gl_object_type{CL_GL_OBJECT_BUFFER});
    EXPECT_EQ(name, fBuffer);
    EXPECT_EQ(infoOf<cl_mem_flags>(clGetMemObjectInfo, memory, CL_MEM_FLAGS),
              cl_mem_flags{CL_MEM_READ_ONLY});
    EXPECT_EQ(infoOf<void*>(clGetMemObjectInfo, memory, CL_MEM_HOST_PTR), nullptr);
    EXPECT_EQ(infoOf<std::size_t>(clGetMemObjectInfo, memory, CL_MEM_SIZE),
              fCount * sizeof(cl_int));
}

// The host pointer of a shared buffer is the layer's.
TEST_F(QueriesTest, SubBufferInfoHidesTheHostPointerOfSharedBuffersOnly)
{
    alignas(128) std::array<char, 4096> storage{};
    const Memory plain = clCreateBuffer(fContext, CL_MEM_READ_WRITE | CL_MEM_USE_HOST_PTR,
                                        storage.size(), storage.data(), nullptr);
    const cl_buffer_region region{128, 1024};
    for (const bool isShared : {false, true}) {
        SCOPED_TRACE(isShared);
        const Memory part = clCreateSubBuffer(isShared ? fMemory : plain, CL_MEM_READ_ONLY,
                                              CL_BUFFER_CREATE_TYPE_REGION, &region, nullptr);
        EXPECT_EQ(infoOf<void*>(clGetMemObjectInfo, part, CL_MEM_HOST_PTR),
                  isShared ? nullptr : storage.data() + region.origin);
        EXPECT_EQ(infoOf<cl_mem_flags>(clGetMemObjectInfo, part, CL_MEM_FLAGS),
                  CL_MEM_READ_ONLY | (isShared ? 0 : CL_MEM_USE_HOST_PTR));
    }
}

// The queries that the layer implements.
TEST_F(QueriesTest, InfoQueriesReturnTheirSizeAndRejectLess)
{
    Event event;
    ASSERT_EQ(fQueue.acquire(fMemory, {}, &event), CL_SUCCESS);
    const Properties list = properties();
    const auto query = [](auto get, auto handle, cl_uint name) {
        return [=](std::size_t size, void* value, std::size_t* needed) {
            return get(handle, name, size, value, needed);
        };
    };
    const std::pair<std::function<cl_int(std::size_t, void*, std::size_t*)>, std::size_t> rows[] = {
        {query(clGetDeviceInfo, fDevice, CL_DEVICE_TYPE), sizeof(cl_device_type)},
        {query(clGetPlatformInfo, fPlatform, CL_PLATFORM_EXTENSIONS),
         extensionsOf(fPlatform).size() + 1},
        {query(clGetGLContextInfoKHR, list.data(), CL_CURRENT_DEVICE_FOR_GL_CONTEXT_KHR),
         sizeof(cl_device_id)},
        {query(clGetContextInfo, cl_context(fContext), CL_CONTEXT_PROPERTIES),
         list.size() * sizeof list[0]},
        {query(clGetGLContextInfoKHR, list.data(), CL_DEVICES_FOR_GL_CONTEXT_KHR),
         sizeof(cl_device_id)},
        {query(clGetMemObjectInfo, cl_mem(fMemory), CL_MEM_FLAGS), sizeof(cl_mem_flags)},
        {query(clGetMemObjectInfo, cl_mem(fMemory), CL_MEM_HOST_PTR), sizeof(void*)},
        {query(clGetEventInfo, cl_event(event), CL_EVENT_COMMAND_TYPE), sizeof(cl_command_type)},
    };
    for (const auto& [getInfo, expected] : rows) {
        std::array<char, 16384> value{};
        std::size_t size = 0;
        EXPECT_EQ(getInfo(0, nullptr, &size), CL_SUCCESS);
        EXPECT_EQ(size, expected);
        EXPECT_EQ(getInfo(size - 1, value.data(), nullptr), CL_INVALID_VALUE);
        EXPECT_EQ(getInfo(size, value.data(), nullptr), CL_SUCCESS);
    }
    EXPECT_EQ(fQueue.release(fMemory), CL_SUCCESS);
}

TEST_F(QueriesTest, EventInfoReturnsTheSharingCommandType)
{
    Event acquired;
    Event released;
    EXPECT_EQ(fQueue.acquire(fMemory, {}, &acquired), CL_SUCCESS);
    EXPECT_EQ(fQueue.release(fMemory, {}, &released), CL_SUCCESS);
    clFinish(fQueue);
    const auto expectCommand = [this](const Event& event, cl_command_type type) {
        clRetainEvent(event);
        clReleaseEvent(event);
        EXPECT_EQ(infoOf<cl_command_type>(clGetEventInfo, event, CL_EVENT_COMMAND_TYPE), type);
        EXPECT_EQ(infoOf<cl_command_queue>(clGetEventInfo, event, CL_EVENT_COMMAND_QUEUE), fQueue);
    };
    expectCommand(acquired, CL_COMMAND_ACQUIRE_GL_OBJECTS);
    expectCommand(released, CL_COMMAND_RELEASE_GL_OBJECTS);
}

} // namespace
