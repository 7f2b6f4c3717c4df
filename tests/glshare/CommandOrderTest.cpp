// When acquires, releases and the events around them happen.
#include "SharingTest.h"

#include <array>
#include <chrono>
#include <future>
#include <thread>
#include <utility>

namespace {

constexpr std::size_t kCount = 1000;

// Far longer than any of the commands takes: a command that has not completed by then is waiting.
constexpr std::chrono::milliseconds kSettled{100};

class CommandOrderTest : public SharingTest {
protected:
    void SetUp() override
    {
        SharingTest::SetUp();
        if (context_ == nullptr)
            return;
        buffer_ = makeGlBuffer(numbersFrom(1, kCount));
        glFinish();
        memory_ = share(buffer_);
        gate_ = clCreateUserEvent(context_, nullptr);
    }

    void TearDown() override
    {
        if (memory_ != nullptr)
            clReleaseMemObject(memory_);
        if (gate_ != nullptr)
            clReleaseEvent(gate_);
        SharingTest::TearDown();
    }

    // Writes `value` everywhere, without waiting.
    void fill(cl_command_queue queue, cl_int value, const std::vector<cl_event>& waitList = {},
              cl_event* event = nullptr)
    {
        EXPECT_EQ(clEnqueueFillBuffer(queue, memory_, &value, sizeof value, 0,
                                      kCount * sizeof(cl_int),
                                      static_cast<cl_uint>(waitList.size()),
                                      waitList.empty() ? nullptr : waitList.data(), event),
                  CL_SUCCESS);
    }

    GLuint buffer_ = 0;
    cl_mem memory_ = nullptr;
    cl_event gate_ = nullptr; // opened by the test
};

// What cl_khr_gl_event alone promises; runs only where it is switched on.
using GlEventTest = CommandOrderTest;

// Without an OpenGL context on the calling thread nothing waits: neither the caller, nor the
// command for less than its wait list, nor what follows in the queue for less than the command.
TEST_F(CommandOrderTest, CommandsWaitForTheirListAndHoldBackTheQueue)
{
    std::array<cl_event, 3> events{};
    onOtherThread([&] {
        EXPECT_EQ(acquire(memory_, {gate_}, &events[0]), CL_SUCCESS);
        fill(queue_, 5, {}, &events[1]);
        EXPECT_EQ(release(memory_, {}, &events[2]), CL_SUCCESS);
        clFlush(queue_);
    });
    std::this_thread::sleep_for(kSettled);
    for (cl_event event : events)
        EXPECT_GT(statusOf(event), CL_COMPLETE);
    EXPECT_EQ(readGl(buffer_, kCount), numbersFrom(1, kCount));

    clSetUserEventStatus(gate_, CL_COMPLETE);
    EXPECT_EQ(clWaitForEvents(1, &events[2]), CL_SUCCESS);
    for (cl_event event : events) {
        EXPECT_EQ(statusOf(event), CL_COMPLETE);
        clReleaseEvent(event);
    }
    EXPECT_EQ(readGl(buffer_, kCount), Numbers(kCount, 5));
}

TEST_F(CommandOrderTest, EventsAloneOrderAQueueWithoutOrder)
{
    cl_int error = CL_SUCCESS;
    cl_command_queue queue =
        clCreateCommandQueue(context_, device_, CL_QUEUE_OUT_OF_ORDER_EXEC_MODE_ENABLE, &error);
    ASSERT_EQ(error, CL_SUCCESS);
    std::array<cl_event, 3> events{};
    onOtherThread([&] {
        EXPECT_EQ(clEnqueueAcquireGLObjects(queue, 1, &memory_, 1, &gate_, &events[0]), CL_SUCCESS);
        fill(queue, 8, {events[0]}, &events[1]);
        EXPECT_EQ(clEnqueueReleaseGLObjects(queue, 1, &memory_, 1, &events[1], &events[2]),
                  CL_SUCCESS);
        clFlush(queue);
    });
    std::this_thread::sleep_for(kSettled);
    for (cl_event event : events)
        EXPECT_GT(statusOf(event), CL_COMPLETE);
    clSetUserEventStatus(gate_, CL_COMPLETE);
    EXPECT_EQ(clWaitForEvents(1, &events[2]), CL_SUCCESS);
    EXPECT_EQ(readGl(buffer_, kCount), Numbers(kCount, 8));
    for (cl_event event : events)
        clReleaseEvent(event);
    clReleaseCommandQueue(queue);
}

// cl_khr_gl_event: drawing after a release sees its result, which needs no OpenCL wait. Without the
// extension the call returns at once.
TEST_F(CommandOrderTest, ReleaseReturnsWhenDoneOnlyWithGlContextAndGlEvent)
{
    ASSERT_EQ(acquire(memory_), CL_SUCCESS);
    fill(queue_, 6, {gate_});
    std::promise<void> mayOpen;
    std::thread opener([this, opens = mayOpen.get_future()]() mutable {
        if (offersGlEvent())
            std::this_thread::sleep_for(kSettled);
        else
            opens.wait();
        clSetUserEventStatus(gate_, CL_COMPLETE);
    });
    cl_event event = nullptr;
    EXPECT_EQ(release(memory_, {}, &event), CL_SUCCESS);
    if (offersGlEvent()) {
        EXPECT_EQ(statusOf(event), CL_COMPLETE);
    } else {
        EXPECT_GT(statusOf(event), CL_COMPLETE);
        mayOpen.set_value();
        clWaitForEvents(1, &event);
    }
    opener.join();
    EXPECT_EQ(readGl(buffer_, kCount), Numbers(kCount, 6));
    clReleaseEvent(event);
}

// The other OpenGL contexts of the process are none of the layer's business.
TEST_F(CommandOrderTest, ContextsOfOtherShareGroupsAreNotWaitedFor)
{
    ASSERT_EQ(acquire(memory_), CL_SUCCESS);
    const EglTestContext stranger;
    ASSERT_TRUE(stranger.valid());
    onOtherThread([&] {
        stranger.makeCurrent();
        fill(queue_, 6, {gate_});
        cl_event event = nullptr;
        EXPECT_EQ(release(memory_, {}, &event), CL_SUCCESS);
        EXPECT_GT(statusOf(event), CL_COMPLETE);
        clReleaseEvent(event);
        EglTestContext::releaseCurrent();
    });
    clSetUserEventStatus(gate_, CL_COMPLETE);
    clFinish(queue_);
}

TEST_F(CommandOrderTest, UserSynchronisationSwitchesTheImpliedOrderOff)
{
    std::vector<cl_context_properties> list = properties(*gl_);
    list.insert(list.end() - 1, {CL_CONTEXT_INTEROP_USER_SYNC, CL_TRUE});
    cl_int error = CL_SUCCESS;
    cl_context context = clCreateContext(list.data(), 1, &device_, nullptr, nullptr, &error);
    ASSERT_EQ(error, CL_SUCCESS);
    cl_command_queue queue = clCreateCommandQueue(context, device_, 0, nullptr);
    cl_mem memory = clCreateFromGLBuffer(context, CL_MEM_READ_WRITE, buffer_, &error);
    cl_event gate = clCreateUserEvent(context, nullptr);
    cl_event event = nullptr;
    EXPECT_EQ(clEnqueueAcquireGLObjects(queue, 1, &memory, 1, &gate, nullptr), CL_SUCCESS);
    EXPECT_EQ(clEnqueueReleaseGLObjects(queue, 1, &memory, 0, nullptr, &event), CL_SUCCESS);
    EXPECT_GT(statusOf(event), CL_COMPLETE);
    clSetUserEventStatus(gate, CL_COMPLETE);
    EXPECT_EQ(clWaitForEvents(1, &event), CL_SUCCESS);
    clReleaseEvent(event);
    clReleaseEvent(gate);
    clReleaseMemObject(memory);
    clReleaseCommandQueue(queue);
    clReleaseContext(context);
}

// Draws a triangle over the whole target, whose fragments write -1 to the buffer of binding 0, each
// to its own place. Nothing waits for it, nor flushes.
void drawIntoBuffer(GLsizei side)
{
    const char* vertex =
        "#version 450\nvoid main() { gl_Position = vec4(gl_VertexID == 1 ? 3 : -1, "
        "gl_VertexID == 2 ? 3 : -1, 0, 1); }";
    const char* fragment =
        "#version 450\nlayout(location = 0) uniform int side; layout(std430, binding = 0) buffer "
        "Numbers { int numbers[]; }; void main() { "
        "numbers[int(gl_FragCoord.y) * side + int(gl_FragCoord.x)] = -1; }";
    const GLuint program = glCreateProgram();
    for (const auto& [stage, text] :
         {std::pair(GL_VERTEX_SHADER, vertex), std::pair(GL_FRAGMENT_SHADER, fragment)}) {
        const GLuint shader = glCreateShader(static_cast<GLenum>(stage));
        glShaderSource(shader, 1, &text, nullptr);
        glCompileShader(shader);
        glAttachShader(program, shader);
    }
    glLinkProgram(program);
    glUseProgram(program);
    glUniform1i(0, side);
    glViewport(0, 0, side, side);
    glDrawArrays(GL_TRIANGLES, 0, 3);
}

// Results of drawing that nobody has waited for, but the implied order.
TEST_F(GlEventTest, AcquireComesAfterPendingDrawing)
{
    constexpr GLsizei kSide = 1024;
    constexpr std::size_t kPixels = std::size_t{kSide} * kSide;
    const GLuint pixels = makeGlBuffer(Numbers(kPixels, 0));
    cl_mem memory = share(pixels);
    GLuint target = 0;
    GLuint frame = 0;
    GLuint vertices = 0;
    glGenTextures(1, &target);
    glBindTexture(GL_TEXTURE_2D, target);
    glTexStorage2D(GL_TEXTURE_2D, 1, GL_RGBA8, kSide, kSide);
    glGenFramebuffers(1, &frame);
    glBindFramebuffer(GL_FRAMEBUFFER, frame);
    glFramebufferTexture2D(GL_FRAMEBUFFER, GL_COLOR_ATTACHMENT0, GL_TEXTURE_2D, target, 0);
    glGenVertexArrays(1, &vertices);
    glBindVertexArray(vertices);
    glBindBufferBase(GL_SHADER_STORAGE_BUFFER, 0, pixels);
    glFinish();
    drawIntoBuffer(kSide);

    EXPECT_EQ(acquire(memory), CL_SUCCESS);
    EXPECT_TRUE(readCl(memory, kPixels) == Numbers(kPixels, -1));
    EXPECT_EQ(release(memory), CL_SUCCESS);
    clReleaseMemObject(memory);
}

// The failure of what it waits for is the command's own, in a queue of either kind.
TEST_F(CommandOrderTest, FailedWaitListsFailTheCommand)
{
    for (const cl_command_queue_properties kind :
         {cl_command_queue_properties{0},
          cl_command_queue_properties{CL_QUEUE_OUT_OF_ORDER_EXEC_MODE_ENABLE}}) {
        SCOPED_TRACE(kind);
        cl_command_queue queue = clCreateCommandQueue(context_, device_, kind, nullptr);
        cl_mem memory = share(buffer_);
        cl_event gate = clCreateUserEvent(context_, nullptr);
        cl_event event = nullptr;
        onOtherThread([&] {
            EXPECT_EQ(clEnqueueAcquireGLObjects(queue, 1, &memory, 1, &gate, &event), CL_SUCCESS);
            clFlush(queue);
        });
        clSetUserEventStatus(gate, -5);
        clWaitForEvents(1, &event);
        EXPECT_LT(statusOf(event), CL_COMPLETE);
        clReleaseEvent(event);
        clReleaseEvent(gate);
        clReleaseMemObject(memory);
        clReleaseCommandQueue(queue);
    }
}

TEST_F(GlEventTest, EventsFollowGlSyncObjects)
{
    const auto createEvent = reinterpret_cast<decltype(&clCreateEventFromGLsyncKHR)>(
        clGetExtensionFunctionAddressForPlatform(platform_, "clCreateEventFromGLsyncKHR"));
    ASSERT_NE(createEvent, nullptr);
    const Numbers drawn = numbersFrom(40, kCount);
    glBufferSubData(GL_ARRAY_BUFFER, 0, kCount * sizeof(cl_int), drawn.data());
    GLsync sync = glFenceSync(GL_SYNC_GPU_COMMANDS_COMPLETE, 0);
    glFlush();
    cl_int error = CL_INVALID_VALUE;
    cl_event event = createEvent(context_, reinterpret_cast<cl_GLsync>(sync), &error);
    ASSERT_EQ(error, CL_SUCCESS);
    cl_command_type type = 0;
    clGetEventInfo(event, CL_EVENT_COMMAND_TYPE, sizeof type, &type, nullptr);
    EXPECT_EQ(type, static_cast<cl_command_type>(CL_COMMAND_GL_FENCE_SYNC_OBJECT_KHR));
    EXPECT_EQ(clSetUserEventStatus(event, CL_COMPLETE), CL_INVALID_EVENT);

    onOtherThread([&] {
        EXPECT_EQ(acquire(memory_, {event}), CL_SUCCESS);
        EXPECT_EQ(readCl(memory_, kCount), drawn);
        EXPECT_EQ(release(memory_), CL_SUCCESS);
    });
    clReleaseEvent(event);
    glDeleteSync(sync);
    EXPECT_EQ(createEvent(context_, reinterpret_cast<cl_GLsync>(this), &error), nullptr);
    EXPECT_EQ(error, CL_INVALID_GL_OBJECT);
}

} // namespace
