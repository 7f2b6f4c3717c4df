// The error codes of calls that break the rules, and that nothing happens besides.
#include "SharingTest.h"

#include <array>
#include <tuple>

namespace {

using MisuseTest = SharingTest;

TEST_F(MisuseTest, AcquireAndReleaseRefuseBadArgumentsAndAWrongTurn)
{
    const Memory plain = clCreateBuffer(context_, CL_MEM_READ_WRITE, 64, nullptr, nullptr);
    const Queue unshared(makeContext({0}), device_);
    const Context other = makeContext();
    const Queue elsewhere(other, device_);
    const Event ended = makeUserEvent();
    clSetUserEventStatus(ended, CL_COMPLETE);
    const std::array<cl_mem, 2> withNull{memory_, nullptr};
    const std::array<cl_mem, 2> withPlain{memory_, plain};
    const std::array<cl_mem, 2> twice{memory_, memory_};
    const cl_mem* const good = twice.data();
    const std::array<cl_event, 2> events{ended, nullptr};
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
        {"nothing at all", queue_, 0, nullptr, 0, nullptr, CL_SUCCESS},
        {"no queue", nullptr, 1, good, 0, nullptr, CL_INVALID_COMMAND_QUEUE},
        {"a queue that does not share", unshared, 1, good, 0, nullptr, CL_INVALID_CONTEXT},
        {"a queue that shares elsewhere", elsewhere, 1, good, 0, nullptr, CL_INVALID_CONTEXT},
        {"a count without a list", queue_, 1, nullptr, 0, nullptr, CL_INVALID_VALUE},
        {"a list without a count", queue_, 0, good, 0, nullptr, CL_INVALID_VALUE},
        {"a null object", queue_, 2, withNull.data(), 0, nullptr, CL_INVALID_MEM_OBJECT},
        {"one not from OpenGL", queue_, 2, withPlain.data(), 0, nullptr, CL_INVALID_GL_OBJECT},
        {"an object twice", queue_, 2, twice.data(), 0, nullptr, CL_INVALID_GL_OBJECT},
        {"a wait count without a list", queue_, 1, good, 1, nullptr, CL_INVALID_EVENT_WAIT_LIST},
        {"a wait list without a count", queue_, 1, good, 0, &events[0], CL_INVALID_EVENT_WAIT_LIST},
        {"a null event", queue_, 1, good, 1, &events[1], CL_INVALID_EVENT_WAIT_LIST},
    };
    const auto enqueue = [&](bool isRelease) {
        return isRelease ? queue_.release(memory_) : queue_.acquire(memory_);
    };
    // For release the objects are acquired, so that nothing but the fault in the row can count.
    for (const bool isRelease : {false, true}) {
        EXPECT_EQ(enqueue(!isRelease), CL_INVALID_GL_OBJECT) << "it is on that side already";
        const auto call = isRelease ? clEnqueueReleaseGLObjects : clEnqueueAcquireGLObjects;
        for (const Row& row : rows) {
            SCOPED_TRACE(std::string(isRelease ? "release: " : "acquire: ") + row.what);
            cl_event event = nullptr;
            EXPECT_EQ(call(row.queue, row.count, row.memory, row.waitCount, row.waitList, &event),
                      row.error);
            EXPECT_EQ(event, nullptr);
        }
        // Still in the state it was in before all those calls.
        EXPECT_EQ(enqueue(isRelease), CL_SUCCESS);
    }
    EXPECT_EQ(enqueue(true), CL_INVALID_GL_OBJECT) << "it is released";
    clFinish(queue_);
}

TEST_F(MisuseTest, CreationNamesWhatIsWrong)
{
    const Context plain = makeContext({0});
    constexpr GLuint kUnknown = 9999;
    std::array<GLuint, 2> names{};
    glGenBuffers(2, names.data());
    const auto [empty, withoutStorage] = names;
    glBindBuffer(GL_ARRAY_BUFFER, withoutStorage);
    const std::tuple<const char*, cl_context, cl_mem_flags, GLuint, cl_int> rows[] = {
        {"no context", nullptr, CL_MEM_READ_WRITE, buffer_, CL_INVALID_CONTEXT},
        {"a context that does not share", plain, CL_MEM_READ_WRITE, buffer_, CL_INVALID_CONTEXT},
        {"flags without use", context_, CL_MEM_ALLOC_HOST_PTR, buffer_, CL_INVALID_VALUE},
        {"an unknown name", context_, CL_MEM_READ_WRITE, kUnknown, CL_INVALID_GL_OBJECT},
        {"a name without a buffer", context_, CL_MEM_READ_WRITE, empty, CL_INVALID_GL_OBJECT},
        {"no storage", context_, CL_MEM_READ_WRITE, withoutStorage, CL_INVALID_GL_OBJECT},
    };
    cl_int error = CL_SUCCESS;
    for (const auto& [what, context, flags, name, expected] : rows) {
        SCOPED_TRACE(what);
        EXPECT_EQ(clCreateFromGLBuffer(context, flags, name, &error), nullptr);
        EXPECT_EQ(error, expected);
        EXPECT_EQ(clCreateFromGLBuffer(context, flags, name, nullptr), nullptr);
    }
    EXPECT_EQ(glIsBuffer(kUnknown), GL_FALSE);

    // Neither is offered.
    EXPECT_EQ(clCreateFromGLTexture(context_, CL_MEM_READ_WRITE, GL_TEXTURE_2D, 0, 1, &error),
              nullptr);
    EXPECT_EQ(error, CL_INVALID_GL_OBJECT);
    EXPECT_EQ(clCreateFromGLRenderbuffer(plain, CL_MEM_READ_WRITE, 1, &error), nullptr);
    EXPECT_EQ(error, CL_INVALID_CONTEXT);
}

TEST_F(MisuseTest, ContextPropertiesNameWhatIsWrong)
{
    const cl_context_properties gl = glEntries_.at(1);
    const cl_context_properties display = glEntries_.at(3);
    constexpr cl_context_properties kEgl = CL_EGL_DISPLAY_KHR;
    constexpr cl_context_properties kNonsense = 0x5eed;
    constexpr cl_int kNoShareGroup = CL_INVALID_GL_SHAREGROUP_REFERENCE_KHR;
    const std::tuple<const char*, cl_context_properties, Properties, cl_int> rows[] = {
        {"no display", gl, {}, kNoShareGroup},
        {"an unknown context", kNonsense, {kEgl, display}, kNoShareGroup},
        {"an unknown display", gl, {kEgl, kNonsense}, kNoShareGroup},
        {"two systems", gl, {kEgl, display, CL_GLX_DISPLAY_KHR, display}, CL_INVALID_OPERATION},
        {"a window system of elsewhere", gl, {CL_WGL_HDC_KHR, display}, CL_INVALID_OPERATION},
        {"a property twice", gl, {kEgl, display, kEgl, display}, CL_INVALID_PROPERTY},
    };
    for (const auto& [what, context, displays, expected] : rows) {
        SCOPED_TRACE(what);
        Properties entries{CL_GL_CONTEXT_KHR, context};
        entries.insert(entries.end(), displays.begin(), displays.end());
        const Properties list = properties(entries);
        cl_int error = CL_SUCCESS;
        EXPECT_EQ(clCreateContext(list.data(), 1, &device_, nullptr, nullptr, &error), nullptr);
        EXPECT_EQ(error, expected);
        cl_device_id device = nullptr;
        EXPECT_EQ(clGetGLContextInfoKHR(list.data(), CL_CURRENT_DEVICE_FOR_GL_CONTEXT_KHR,
                                        sizeof(cl_device_id), &device, nullptr),
                  expected);
    }
}

TEST_F(MisuseTest, QueriesRefuseWhatIsNotShared)
{
    const Memory plain = clCreateBuffer(context_, CL_MEM_READ_WRITE, 64, nullptr, nullptr);
    cl_gl_object_type type = 0;
    EXPECT_EQ(clGetGLObjectInfo(nullptr, &type, nullptr), CL_INVALID_MEM_OBJECT);
    EXPECT_EQ(clGetGLObjectInfo(plain, &type, nullptr), CL_INVALID_GL_OBJECT);
    EXPECT_EQ(clGetGLTextureInfo(nullptr, CL_GL_TEXTURE_TARGET, 0, nullptr, nullptr),
              CL_INVALID_MEM_OBJECT);
    EXPECT_EQ(clGetGLTextureInfo(memory_, CL_GL_TEXTURE_TARGET, 0, nullptr, nullptr),
              CL_INVALID_GL_OBJECT);
}

// Gone for OpenGL, or too small by now; OpenCL's object is still an object.
TEST_F(MisuseTest, BuffersThatOpenGlTookAwayAreRefusedAndHarmless)
{
    // Large enough to be unmapped when it is freed.
    constexpr std::size_t kLarge = 100000;
    const GLuint shrunk = makeGlBuffer(numbersFrom(1, kLarge));
    const Memory small = share(shrunk);
    refill(shrunk, numbersFrom(1, 4));
    EXPECT_EQ(queue_.acquire(small), CL_INVALID_GL_OBJECT);
    EXPECT_EQ(queue_.release(small), CL_INVALID_GL_OBJECT);

    const GLuint deleted = makeGlBuffer(numbersFrom(1, kLarge));
    const Memory orphan = share(deleted);
    ASSERT_EQ(queue_.acquire(orphan), CL_SUCCESS);
    glDeleteBuffers(1, &deleted);
    EXPECT_EQ(queue_.release(orphan), CL_SUCCESS);
    EXPECT_EQ(queue_.acquire(orphan), CL_INVALID_GL_OBJECT);
    EXPECT_EQ(glIsBuffer(deleted), GL_FALSE);

    for (cl_mem memory : {cl_mem(small), cl_mem(orphan)}) {
        queue_.write(memory, numbersFrom(3, kLarge));
        EXPECT_EQ(queue_.read(memory, kLarge), numbersFrom(3, kLarge));
    }
}

} // namespace
