// The error codes of calls that break the rules, and that nothing happens besides.
#include "SharingTest.h"

#include <array>
#include <functional>

namespace {

constexpr std::size_t kCount = 100;

class MisuseTest : public SharingTest {
protected:
    void SetUp() override
    {
        SharingTest::SetUp();
        if (context_ == nullptr)
            return;
        buffer_ = makeGlBuffer(numbersFrom(1, kCount));
        glFinish();
        memory_ = share(buffer_);
        plain_ = clCreateBuffer(context_, CL_MEM_READ_WRITE, 64, nullptr, nullptr);
        otherContext_ = clCreateContext(nullptr, 1, &device_, nullptr, nullptr, nullptr);
        otherQueue_ = clCreateCommandQueue(otherContext_, device_, 0, nullptr);
    }

    void TearDown() override
    {
        if (context_ != nullptr) {
            clReleaseMemObject(memory_);
            clReleaseMemObject(plain_);
            clReleaseCommandQueue(otherQueue_);
            clReleaseContext(otherContext_);
        }
        SharingTest::TearDown();
    }

    GLuint buffer_ = 0;
    cl_mem memory_ = nullptr;
    cl_mem plain_ = nullptr;            // of context_, but not from OpenGL
    cl_context otherContext_ = nullptr; // one that does not share
    cl_command_queue otherQueue_ = nullptr;
};

TEST_F(MisuseTest, AcquireAndReleaseRefuseBadArguments)
{
    struct Row {
        const char* what;
        cl_command_queue queue;
        cl_uint count;
        std::array<cl_mem, 2> memory;
        bool hasList;
        cl_uint waitCount;
        std::array<cl_event, 1> waitList;
        bool hasWaitList;
        cl_int error;
    };
    cl_event good = clCreateUserEvent(context_, nullptr);
    clSetUserEventStatus(good, CL_COMPLETE);
    const Row rows[] = {
        {"nothing at all", queue_, 0, {}, false, 0, {}, false, CL_SUCCESS},
        {"no queue", nullptr, 1, {memory_}, true, 0, {}, false, CL_INVALID_COMMAND_QUEUE},
        {"a queue that does not share",
         otherQueue_,
         1,
         {memory_},
         true,
         0,
         {},
         false,
         CL_INVALID_CONTEXT},
        {"a count without a list", queue_, 1, {}, false, 0, {}, false, CL_INVALID_VALUE},
        {"a list without a count", queue_, 0, {memory_}, true, 0, {}, false, CL_INVALID_VALUE},
        {"a null object", queue_, 2, {memory_, nullptr}, true, 0, {}, false, CL_INVALID_MEM_OBJECT},
        {"an object not from OpenGL",
         queue_,
         2,
         {memory_, plain_},
         true,
         0,
         {},
         false,
         CL_INVALID_GL_OBJECT},
        {"an object twice",
         queue_,
         2,
         {memory_, memory_},
         true,
         0,
         {},
         false,
         CL_INVALID_GL_OBJECT},
        {"a wait count without a list",
         queue_,
         1,
         {memory_},
         true,
         1,
         {},
         false,
         CL_INVALID_EVENT_WAIT_LIST},
        {"a wait list without a count",
         queue_,
         1,
         {memory_},
         true,
         0,
         {good},
         true,
         CL_INVALID_EVENT_WAIT_LIST},
        {"a null event",
         queue_,
         1,
         {memory_},
         true,
         1,
         {nullptr},
         true,
         CL_INVALID_EVENT_WAIT_LIST},
    };
    // For release the objects are acquired, so that nothing but the fault in the row can count.
    for (const bool isRelease : {false, true}) {
        const auto call = isRelease ? clEnqueueReleaseGLObjects : clEnqueueAcquireGLObjects;
        for (const Row& row : rows) {
            SCOPED_TRACE(std::string(isRelease ? "release: " : "acquire: ") + row.what);
            cl_event event = nullptr;
            EXPECT_EQ(call(row.queue, row.count, row.hasList ? row.memory.data() : nullptr,
                           row.waitCount, row.hasWaitList ? row.waitList.data() : nullptr, &event),
                      row.error);
            EXPECT_EQ(event, nullptr);
        }
        // Still in the state it was in before all those calls.
        EXPECT_EQ(isRelease ? release(memory_) : acquire(memory_), CL_SUCCESS);
    }
    clReleaseEvent(good);
    clFinish(queue_);
}

TEST_F(MisuseTest, ObjectsAreAcquiredOnceAndReleasedOnce)
{
    EXPECT_EQ(release(memory_), CL_INVALID_GL_OBJECT);
    EXPECT_EQ(acquire(memory_), CL_SUCCESS);
    EXPECT_EQ(acquire(memory_), CL_INVALID_GL_OBJECT);
    EXPECT_EQ(release(memory_), CL_SUCCESS);
    EXPECT_EQ(release(memory_), CL_INVALID_GL_OBJECT);
    clFinish(queue_);
}

TEST_F(MisuseTest, ObjectsOfAnotherSharingContextAreRefused)
{
    cl_context context =
        clCreateContext(properties(*gl_).data(), 1, &device_, nullptr, nullptr, nullptr);
    cl_command_queue queue = clCreateCommandQueue(context, device_, 0, nullptr);
    EXPECT_EQ(clEnqueueAcquireGLObjects(queue, 1, &memory_, 0, nullptr, nullptr),
              CL_INVALID_CONTEXT);
    clReleaseCommandQueue(queue);
    clReleaseContext(context);
}

TEST_F(MisuseTest, CreationNamesWhatIsWrong)
{
    GLuint empty = 0;
    glGenBuffers(1, &empty);
    GLuint withoutStorage = 0;
    glGenBuffers(1, &withoutStorage);
    glBindBuffer(GL_ARRAY_BUFFER, withoutStorage);
    GLuint texture = 0;
    glGenTextures(1, &texture);
    struct Row {
        const char* what;
        std::function<cl_mem(cl_int*)> create;
        cl_int error;
    };
    const Row rows[] = {
        {"no context",
         [&](cl_int* e) { return clCreateFromGLBuffer(nullptr, CL_MEM_READ_WRITE, buffer_, e); },
         CL_INVALID_CONTEXT},
        {"a context that does not share",
         [&](cl_int* e) {
             return clCreateFromGLBuffer(otherContext_, CL_MEM_READ_WRITE, buffer_, e);
         },
         CL_INVALID_CONTEXT},
        {"flags that OpenGL sharing has no use for",
         [&](cl_int* e) {
             return clCreateFromGLBuffer(context_, CL_MEM_ALLOC_HOST_PTR, buffer_, e);
         },
         CL_INVALID_VALUE},
        {"an unknown name",
         [&](cl_int* e) { return clCreateFromGLBuffer(context_, CL_MEM_READ_WRITE, 9999, e); },
         CL_INVALID_GL_OBJECT},
        {"a name without a buffer",
         [&](cl_int* e) { return clCreateFromGLBuffer(context_, CL_MEM_READ_WRITE, empty, e); },
         CL_INVALID_GL_OBJECT},
        {"a buffer without storage",
         [&](cl_int* e) {
             return clCreateFromGLBuffer(context_, CL_MEM_READ_WRITE, withoutStorage, e);
         },
         CL_INVALID_GL_OBJECT},
        {"a texture",
         [&](cl_int* e) {
             return clCreateFromGLTexture(context_, CL_MEM_READ_WRITE, GL_TEXTURE_2D, 0, texture,
                                          e);
         },
         CL_INVALID_GL_OBJECT},
        {"a renderbuffer of a context that does not share",
         [&](cl_int* e) {
             return clCreateFromGLRenderbuffer(otherContext_, CL_MEM_READ_WRITE, 1, e);
         },
         CL_INVALID_CONTEXT},
    };
    for (const Row& row : rows) {
        SCOPED_TRACE(row.what);
        cl_int error = CL_SUCCESS;
        EXPECT_EQ(row.create(&error), nullptr);
        EXPECT_EQ(error, row.error);
        EXPECT_EQ(row.create(nullptr), nullptr);
    }
    EXPECT_EQ(glIsBuffer(9999), GL_FALSE);
}

TEST_F(MisuseTest, ContextPropertiesNameWhatIsWrong)
{
    const auto gl = reinterpret_cast<cl_context_properties>(gl_->handle());
    const auto display = reinterpret_cast<cl_context_properties>(EglTestContext::display());
    constexpr cl_context_properties kNonsense = 0x5eed;
    struct Row {
        const char* what;
        std::vector<cl_context_properties> list;
        cl_int error;
    };
    const Row rows[] = {
        {"no display", {CL_GL_CONTEXT_KHR, gl}, CL_INVALID_GL_SHAREGROUP_REFERENCE_KHR},
        {"an unknown context",
         {CL_GL_CONTEXT_KHR, kNonsense, CL_EGL_DISPLAY_KHR, display},
         CL_INVALID_GL_SHAREGROUP_REFERENCE_KHR},
        {"an unknown display",
         {CL_GL_CONTEXT_KHR, gl, CL_EGL_DISPLAY_KHR, kNonsense},
         CL_INVALID_GL_SHAREGROUP_REFERENCE_KHR},
        {"two window systems",
         {CL_GL_CONTEXT_KHR, gl, CL_EGL_DISPLAY_KHR, display, CL_GLX_DISPLAY_KHR, display},
         CL_INVALID_OPERATION},
        {"a window system of elsewhere",
         {CL_GL_CONTEXT_KHR, gl, CL_WGL_HDC_KHR, display},
         CL_INVALID_OPERATION},
        {"a property twice",
         {CL_GL_CONTEXT_KHR, gl, CL_EGL_DISPLAY_KHR, display, CL_EGL_DISPLAY_KHR, display},
         CL_INVALID_PROPERTY},
    };
    const auto getInfo = reinterpret_cast<clGetGLContextInfoKHR_fn>(
        clGetExtensionFunctionAddressForPlatform(platform_, "clGetGLContextInfoKHR"));
    ASSERT_NE(getInfo, nullptr);
    for (const Row& row : rows) {
        SCOPED_TRACE(row.what);
        std::vector<cl_context_properties> list{CL_CONTEXT_PLATFORM,
                                                reinterpret_cast<cl_context_properties>(platform_)};
        list.insert(list.end(), row.list.begin(), row.list.end());
        list.push_back(0);
        cl_int error = CL_SUCCESS;
        EXPECT_EQ(clCreateContext(list.data(), 1, &device_, nullptr, nullptr, &error), nullptr);
        EXPECT_EQ(error, row.error);
        cl_device_id device = nullptr;
        EXPECT_EQ(getInfo(list.data(), CL_CURRENT_DEVICE_FOR_GL_CONTEXT_KHR, sizeof(cl_device_id),
                          &device, nullptr),
                  row.error);
    }
}

TEST_F(MisuseTest, QueriesRefuseWhatIsNotShared)
{
    cl_gl_object_type type = 0;
    EXPECT_EQ(clGetGLObjectInfo(nullptr, &type, nullptr), CL_INVALID_MEM_OBJECT);
    EXPECT_EQ(clGetGLObjectInfo(plain_, &type, nullptr), CL_INVALID_GL_OBJECT);
    EXPECT_EQ(clGetGLTextureInfo(nullptr, CL_GL_TEXTURE_TARGET, 0, nullptr, nullptr),
              CL_INVALID_MEM_OBJECT);
    EXPECT_EQ(clGetGLTextureInfo(memory_, CL_GL_TEXTURE_TARGET, 0, nullptr, nullptr),
              CL_INVALID_GL_OBJECT);
}

// Gone for OpenGL, or too small by now; OpenCL's object is still an object.
TEST_F(MisuseTest, BuffersThatOpenGlTookAwayAreRefusedAndHarmless)
{
    const GLuint shrunk = makeGlBuffer(numbersFrom(1, kCount * 1000));
    cl_mem small = share(shrunk);
    glBindBuffer(GL_ARRAY_BUFFER, shrunk);
    glBufferData(GL_ARRAY_BUFFER, 16, nullptr, GL_DYNAMIC_DRAW);
    EXPECT_EQ(acquire(small), CL_INVALID_GL_OBJECT);
    EXPECT_EQ(release(small), CL_INVALID_GL_OBJECT);

    const GLuint deleted = makeGlBuffer(numbersFrom(1, kCount * 1000));
    cl_mem orphan = share(deleted);
    ASSERT_EQ(acquire(orphan), CL_SUCCESS);
    glDeleteBuffers(1, &deleted);
    EXPECT_EQ(release(orphan), CL_SUCCESS);
    EXPECT_EQ(acquire(orphan), CL_INVALID_GL_OBJECT);
    EXPECT_EQ(glIsBuffer(deleted), GL_FALSE);

    for (cl_mem memory : {small, orphan}) {
        writeCl(memory, numbersFrom(3, kCount * 1000));
        EXPECT_EQ(readCl(memory, kCount * 1000), numbersFrom(3, kCount * 1000));
        clReleaseMemObject(memory);
    }
}

} // namespace
