// The error codes of invalid calls, which must have no other effect.
#include "SharingTest.h"

#include <array>
#include <functional>
#include <tuple>

namespace {

using MisuseTest = SharingTest;

TEST_F(MisuseTest, AcquireAndReleaseWithInvalidArgumentsReturnTheirError)
{
    const Memory plain = clCreateBuffer(fContext, CL_MEM_READ_WRITE, 64, nullptr, nullptr);
    const Queue unshared(makeContext({0}), fDevice);
    const Context other = makeContext();
    const Queue elsewhere(other, fDevice);
    const Event ended = makeUserEvent();
    clSetUserEventStatus(ended, CL_COMPLETE);
    const std::array<cl_mem, 2> withNull{fMemory, nullptr};
    const std::array<cl_mem, 2> withPlain{fMemory, plain};
    const std::array<cl_mem, 2> twice{fMemory, fMemory};
    const cl_buffer_region region{0, 64};
    Memory part = clCreateSubBuffer(fMemory, CL_MEM_READ_WRITE, CL_BUFFER_CREATE_TYPE_REGION,
                                    &region, nullptr);
    const cl_mem* const good = twice.data();
    const std::array<cl_event, 2> events{ended, nullptr};
    Event foreign = clCreateUserEvent(other, nullptr);
    struct Row {
        const char* what;
        cl_command_queue queue;
        cl_uint count;
        const cl_mem* memory;
        cl_uint waitCount;
        const cl_event* waitList;
        cl_int error;
    };
    const Row rows[] = {
        {"no objects", fQueue, 0, nullptr, 0, nullptr, CL_SUCCESS},
        {"no queue", nullptr, 1, good, 0, nullptr, CL_INVALID_COMMAND_QUEUE},
        {"a queue of a context without sharing", unshared, 1, good, 0, nullptr, CL_INVALID_CONTEXT},
        {"a queue of another context", elsewhere, 1, good, 0, nullptr, CL_INVALID_CONTEXT},
        {"a count without a list", fQueue, 1, nullptr, 0, nullptr, CL_INVALID_VALUE},
        {"a list without a count", fQueue, 0, good, 0, nullptr, CL_INVALID_VALUE},
        {"a null object", fQueue, 2, withNull.data(), 0, nullptr, CL_INVALID_MEM_OBJECT},
        {"an object not from OpenGL", fQueue, 2, withPlain.data(), 0, nullptr,
         CL_INVALID_GL_OBJECT},
        {"a sub-buffer", fQueue, 1, part.address(), 0, nullptr, CL_INVALID_GL_OBJECT},
        {"a count above the maximum", fQueue, ~0U, good, 0, nullptr, CL_INVALID_VALUE},
        {"an object twice", fQueue, 2, twice.data(), 0, nullptr, CL_INVALID_GL_OBJECT},
        {"a wait count without a list", fQueue, 1, good, 1, nullptr, CL_INVALID_EVENT_WAIT_LIST},
        {"a wait list without a count", fQueue, 1, good, 0, &events[0], CL_INVALID_EVENT_WAIT_LIST},
        {"a null event", fQueue, 1, good, 1, &events[1], CL_INVALID_EVENT_WAIT_LIST},
        {"a wait count above the maximum", fQueue, 1, good, ~0U, &events[0],
         CL_INVALID_EVENT_WAIT_LIST},
        {"an event of another context", fQueue, 1, good, 1, foreign.address(), CL_INVALID_CONTEXT},
    };
    const auto enqueue = [&](bool isRelease) {
        return isRelease ? fQueue.release(fMemory) : fQueue.acquire(fMemory);
    };
    // The objects are acquired before the rows of release, so that only the row's argument is
    // invalid.
    for (const bool isRelease : {false, true}) {
        EXPECT_EQ(enqueue(!isRelease), CL_INVALID_GL_OBJECT) << "acquired or released twice";
        const auto call = isRelease ? clEnqueueReleaseGLObjects : clEnqueueAcquireGLObjects;
        for (const Row& row : rows) {
            SCOPED_TRACE(std::string(isRelease ? "release: " : "acquire: ") + row.what);
            cl_event event = nullptr;
            EXPECT_EQ(call(row.queue, row.count, row.memory, row.waitCount, row.waitList, &event),
                      row.error);
            EXPECT_EQ(event, nullptr);
        }
        // The state is unchanged.
        EXPECT_EQ(enqueue(isRelease), CL_SUCCESS);
    }
    EXPECT_EQ(enqueue(true), CL_INVALID_GL_OBJECT) << "released twice";
    clFinish(fQueue);
}

// Each row has one invalid argument.
TEST_F(MisuseTest, CreationWithInvalidArgumentReturnsItsError)
{
    const Context plain = makeContext({0});
    constexpr GLuint kUnknown = 9999;
    std::array<GLuint, 2> names{};
    glGenBuffers(2, names.data());
    const auto [empty, withoutStorage] = names;
    glBindBuffer(GL_ARRAY_BUFFER, withoutStorage);
    constexpr cl_mem_flags kAccess = CL_MEM_READ_WRITE;
    const auto buffer = [](cl_context context, cl_mem_flags flags, GLuint name) {
        return [=](cl_int* error) { return clCreateFromGLBuffer(context, flags, name, error); };
    };
    const auto renderbuffer = [](cl_context context, cl_mem_flags flags) {
        return [=](cl_int* error) { return clCreateFromGLRenderbuffer(context, flags, 1, error); };
    };
    const auto texture = [](auto create, cl_context context, cl_mem_flags flags, cl_GLenum target,
                            cl_GLint level) {
        return [=](cl_int* error) { return create(context, flags, target, level, 1, error); };
    };
    const auto any = clCreateFromGLTexture;
    const auto texture2D = clCreateFromGLTexture2D;
    const auto texture3D = clCreateFromGLTexture3D;
    const std::tuple<const char*, cl_int, std::function<cl_mem(cl_int*)>> rows[] = {
        {"no context", CL_INVALID_CONTEXT, buffer(nullptr, kAccess, fBuffer)},
        {"a context without sharing", CL_INVALID_CONTEXT, buffer(plain, kAccess, fBuffer)},
        {"flags without access", CL_INVALID_VALUE,
         buffer(fContext, CL_MEM_ALLOC_HOST_PTR, fBuffer)},
        {"two kinds of access", CL_INVALID_VALUE,
         buffer(fContext, CL_MEM_READ_ONLY | CL_MEM_WRITE_ONLY, fBuffer)},
        {"an unknown name", CL_INVALID_GL_OBJECT, buffer(fContext, kAccess, kUnknown)},
        {"a name not yet bound", CL_INVALID_GL_OBJECT, buffer(fContext, kAccess, empty)},
        {"no storage", CL_INVALID_GL_OBJECT, buffer(fContext, kAccess, withoutStorage)},
        {"a renderbuffer", CL_INVALID_GL_OBJECT, renderbuffer(fContext, kAccess)},
        {"invalid flags", CL_INVALID_VALUE, renderbuffer(fContext, CL_MEM_USE_HOST_PTR)},
        {"a context without sharing", CL_INVALID_CONTEXT, renderbuffer(plain, CL_MEM_USE_HOST_PTR)},
        {"a texture", CL_INVALID_GL_OBJECT, texture(any, fContext, 0, GL_TEXTURE_2D_ARRAY, 0)},
        {"a face of a cube map", CL_INVALID_GL_OBJECT,
         texture(any, fContext, kAccess, GL_TEXTURE_CUBE_MAP_NEGATIVE_Z, 0)},
        {"a context without sharing", CL_INVALID_CONTEXT,
         texture(any, plain, kAccess, GL_TEXTURE_CUBE_MAP, -1)},
        {"invalid flags", CL_INVALID_VALUE,
         texture(any, fContext, CL_MEM_COPY_HOST_PTR, GL_TEXTURE_2D, 0)},
        {"a whole cube map", CL_INVALID_VALUE,
         texture(any, fContext, kAccess, GL_TEXTURE_CUBE_MAP, 0)},
        {"not a target", CL_INVALID_VALUE, texture(any, fContext, kAccess, GL_ARRAY_BUFFER, 0)},
        {"a negative level", CL_INVALID_MIP_LEVEL,
         texture(any, fContext, kAccess, GL_TEXTURE_1D, -1)},
        {"2D", CL_INVALID_GL_OBJECT,
         texture(texture2D, fContext, kAccess, GL_TEXTURE_RECTANGLE, 0)},
        {"2D of a 3D target", CL_INVALID_VALUE,
         texture(texture2D, fContext, kAccess, GL_TEXTURE_3D, 0)},
        {"3D", CL_INVALID_GL_OBJECT, texture(texture3D, fContext, kAccess, GL_TEXTURE_3D, 0)},
        {"3D of a 2D target", CL_INVALID_VALUE,
         texture(texture3D, fContext, kAccess, GL_TEXTURE_2D, 0)},
    };
    for (const auto& [what, expected, create] : rows) {
        SCOPED_TRACE(what);
        cl_int error = CL_SUCCESS;
        EXPECT_EQ(create(&error), nullptr);
        EXPECT_EQ(error, expected);
        EXPECT_EQ(create(nullptr), nullptr);
    }
    EXPECT_EQ(glIsBuffer(kUnknown), GL_FALSE);
}

TEST_F(MisuseTest, InvalidContextPropertiesReturnTheirError)
{
    const cl_context_properties gl = fGlEntries.at(1);
    const cl_context_properties display = fGlEntries.at(3);
    constexpr cl_context_properties kEgl = CL_EGL_DISPLAY_KHR;
    constexpr cl_context_properties kInvalid = 0x5eed;
    constexpr cl_int kNoShareGroup = CL_INVALID_GL_SHAREGROUP_REFERENCE_KHR;
    const cl_context_properties platform = reinterpret_cast<cl_context_properties>(fPlatform);
    const std::ptrdiff_t threads = threadCount();
    const auto check = [&](const char* what, cl_int expected, Properties others,
                           cl_context_properties context = 0, cl_int ofQuery = CL_SUCCESS) {
        SCOPED_TRACE(what);
        others.insert(others.begin(), {CL_GL_CONTEXT_KHR, context == 0 ? gl : context});
        const Properties list = properties(others);
        cl_int error = CL_SUCCESS;
        EXPECT_EQ(clCreateContext(list.data(), 1, &fDevice, nullptr, nullptr, &error), nullptr);
        EXPECT_EQ(error, expected);
        EXPECT_EQ(
            clCreateContextFromType(list.data(), CL_DEVICE_TYPE_ALL, nullptr, nullptr, &error),
            nullptr);
        EXPECT_EQ(error, expected);
        cl_device_id device = nullptr;
        EXPECT_EQ(clGetGLContextInfoKHR(list.data(), CL_CURRENT_DEVICE_FOR_GL_CONTEXT_KHR,
                                        sizeof(cl_device_id), &device, nullptr),
                  ofQuery == CL_SUCCESS ? expected : ofQuery);
    };
    check("no display", kNoShareGroup, {});
    check("an unknown context", kNoShareGroup, {kEgl, display}, kInvalid);
    check("an unknown display", kNoShareGroup, {kEgl, kInvalid});
    check("two displays", CL_INVALID_OPERATION, {kEgl, display, CL_GLX_DISPLAY_KHR, display});
    check("an unsupported window system", CL_INVALID_OPERATION, {CL_WGL_HDC_KHR, display});
    check("an unsupported share group", CL_INVALID_OPERATION, {CL_CGL_SHAREGROUP_KHR, gl});
    check("a property twice", CL_INVALID_PROPERTY, {kEgl, display, kEgl, display});
    check("a platform twice", CL_INVALID_PROPERTY, {kEgl, display, CL_CONTEXT_PLATFORM, platform});
    check("neither true nor false", CL_INVALID_PROPERTY,
          {kEgl, display, CL_CONTEXT_INTEROP_USER_SYNC, 2});
    check("an unknown name", CL_INVALID_PROPERTY, {kEgl, display, kInvalid, 1}, 0,
          CL_INVALID_VALUE);
    // The system may list a thread for a moment after it was joined.
    EXPECT_TRUE(becomesTrue([&] { return threadCount() <= threads; }));
}

TEST_F(MisuseTest, InvalidContextDevicesReturnTheirError)
{
    const Properties list = properties();
    const std::array<cl_device_id, 2> devices{fDevice, nullptr};
    int user = 0;
    const std::tuple<const char*, cl_uint, const cl_device_id*, void*, cl_int> rows[] = {
        {"no devices", 0, nullptr, nullptr, CL_INVALID_VALUE},
        {"a count without a list", 1, nullptr, nullptr, CL_INVALID_VALUE},
        {"a list without a count", 0, devices.data(), nullptr, CL_INVALID_VALUE},
        {"a count above the maximum", ~0U, devices.data(), nullptr, CL_INVALID_VALUE},
        {"a null device", 2, devices.data(), nullptr, CL_INVALID_DEVICE},
        {"user data without a callback", 1, devices.data(), &user, CL_INVALID_VALUE},
    };
    for (const auto& [what, count, first, data, expected] : rows) {
        SCOPED_TRACE(what);
        cl_int error = CL_SUCCESS;
        EXPECT_EQ(clCreateContext(list.data(), count, first, nullptr, data, &error), nullptr);
        EXPECT_EQ(error, expected);
    }
}

TEST_F(MisuseTest, DeviceTypeWithoutDevicesStillChecksOtherArguments)
{
    const Properties list = properties();
    cl_device_id device = nullptr;
    cl_uint count = 7;
    const cl_int ofNullPlatform = clGetDeviceIDs(nullptr, CL_DEVICE_TYPE_ALL, 1, &device, nullptr);
    const std::tuple<const char*, cl_platform_id, cl_uint, cl_device_id*, cl_uint*, cl_int> rows[] =
        {
            {"valid", fPlatform, 1, &device, &count, CL_SUCCESS},
            {"count only", fPlatform, 0, nullptr, &count, CL_SUCCESS},
            {"null platform", nullptr, 1, &device, nullptr, ofNullPlatform},
            {"no entries", fPlatform, 0, &device, &count, CL_INVALID_VALUE},
            {"no output", fPlatform, 1, nullptr, nullptr, CL_INVALID_VALUE},
        };
    for (const cl_device_type type :
         {cl_device_type{CL_DEVICE_TYPE_CPU}, cl_device_type{CL_DEVICE_TYPE_GPU}}) {
        const cl_int found = clGetDeviceIDs(fPlatform, type, 1, &device, nullptr);
        cl_int error = CL_SUCCESS;
        EXPECT_EQ(clCreateContextFromType(list.data(), type, nullptr, &count, &error), nullptr);
        EXPECT_EQ(error, CL_INVALID_VALUE) << "user data without a callback";
        for (const auto& [what, platform, capacity, devices, number, expected] : rows) {
            SCOPED_TRACE(what);
            EXPECT_EQ(clGetDeviceIDs(platform, type, capacity, devices, number),
                      expected == CL_SUCCESS ? found : expected);
        }
    }
    EXPECT_LE(count, 1U);
}

TEST_F(MisuseTest, QueriesOfOtherObjectsReturnTheirError)
{
    const Memory plain = clCreateBuffer(fContext, CL_MEM_READ_WRITE, 64, nullptr, nullptr);
    Event acquired;
    ASSERT_EQ(fQueue.acquire(fMemory, {}, &acquired), CL_SUCCESS);
    ASSERT_EQ(fQueue.release(fMemory), CL_SUCCESS);
    clFinish(fQueue);
    cl_gl_object_type type = 0;
    std::array<char, 64> value{};
    const auto info = [&](auto get, auto handle, cl_uint name) {
        return get(handle, name, value.size(), static_cast<void*>(value.data()), nullptr);
    };
    const std::tuple<const char*, cl_int, cl_int> rows[] = {
        {"object: null", clGetGLObjectInfo(nullptr, &type, nullptr), CL_INVALID_MEM_OBJECT},
        {"object: not shared", clGetGLObjectInfo(plain, &type, nullptr), CL_INVALID_GL_OBJECT},
        {"texture: null", info(clGetGLTextureInfo, cl_mem(), CL_GL_TEXTURE_TARGET),
         CL_INVALID_MEM_OBJECT},
        {"texture: not shared", info(clGetGLTextureInfo, cl_mem(plain), CL_GL_TEXTURE_TARGET),
         CL_INVALID_GL_OBJECT},
        {"texture: a buffer", info(clGetGLTextureInfo, cl_mem(fMemory), CL_GL_TEXTURE_TARGET),
         CL_INVALID_GL_OBJECT},
        {"memory: null", info(clGetMemObjectInfo, cl_mem(), CL_MEM_FLAGS), CL_INVALID_MEM_OBJECT},
        {"context: null", info(clGetContextInfo, cl_context(), CL_CONTEXT_PROPERTIES),
         CL_INVALID_CONTEXT},
        {"context: release", clReleaseContext(nullptr), CL_INVALID_CONTEXT},
        {"event: null", info(clGetEventInfo, cl_event(), CL_EVENT_COMMAND_TYPE), CL_INVALID_EVENT},
        {"event: release", clReleaseEvent(nullptr), CL_INVALID_EVENT},
        {"event: set", clSetUserEventStatus(nullptr, CL_COMPLETE), CL_INVALID_EVENT},
        {"event: set of a command", clSetUserEventStatus(acquired, CL_COMPLETE), CL_INVALID_EVENT},
        {"device: null", info(clGetDeviceInfo, cl_device_id(), CL_DEVICE_TYPE), CL_INVALID_DEVICE},
    };
    for (const auto& [what, error, expected] : rows)
        EXPECT_EQ(error, expected) << what;
}

// The memory objects stay usable without sharing.
TEST_F(MisuseTest, AcquireOfDeletedOrShrunkBufferReturnsInvalidGlObject)
{
    // Large enough to be unmapped when it is freed.
    constexpr std::size_t kLarge = 100000;
    const GLuint shrunk = makeGlBuffer(numbersFrom(1, kLarge));
    const Memory small = share(shrunk);
    reallocate(shrunk, numbersFrom(1, 4));
    EXPECT_EQ(fQueue.acquire(small), CL_INVALID_GL_OBJECT);
    EXPECT_EQ(fQueue.release(small), CL_INVALID_GL_OBJECT);

    const GLuint deleted = makeGlBuffer(numbersFrom(1, kLarge));
    const Memory orphan = share(deleted);
    ASSERT_EQ(fQueue.acquire(orphan), CL_SUCCESS);
    glDeleteBuffers(1, &deleted);
    EXPECT_EQ(fQueue.release(orphan), CL_SUCCESS);
    EXPECT_EQ(fQueue.acquire(orphan), CL_INVALID_GL_OBJECT);
    EXPECT_EQ(glIsBuffer(deleted), GL_FALSE);

    for (cl_mem memory : {cl_mem(small), cl_mem(orphan)}) {
        fQueue.write(memory, numbersFrom(3, kLarge));
        EXPECT_EQ(fQueue.read(memory, kLarge), numbersFrom(3, kLarge));
    }
}

} // namespace
