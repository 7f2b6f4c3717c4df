// When acquires, releases and the events around them happen.
#include "SharingTest.h"

#include <array>
#include <chrono>
#include <thread>
#include <utility>

namespace {

// Far longer than any of the commands takes: a command that has not completed by then is waiting.
constexpr std::chrono::milliseconds kSettled{100};

constexpr std::array<cl_command_queue_properties, 2> kQueueKinds{
    0, CL_QUEUE_OUT_OF_ORDER_EXEC_MODE_ENABLE};

using CommandOrderTest = SharingTest;

// What cl_khr_gl_event alone promises; runs only where it is switched on.
using GlEventTest = SharingTest;

// Without an OpenGL context on the calling thread nothing waits: neither the caller, nor the
// command for less than its wait list, nor what follows it for less than the command. In a queue
// without order that is what follows it by events.
TEST_F(CommandOrderTest, CommandsWaitForTheirListAndHoldBackWhatFollows)
{
    for (cl_int value = 5; const cl_command_queue_properties kind : kQueueKinds) {
        SCOPED_TRACE(kind);
        const Queue queue(fContext, fDevice, kind);
        const Event gate = makeUserEvent();
        std::array<Event, 3> events;
        const auto after = [&](const Event& event) {
            return kind == 0 ? WaitList{} : WaitList{event};
        };
        const Numbers before = readGl(fBuffer, fCount);
        onOtherThread([&] {
            EXPECT_EQ(queue.acquire(fMemory, {gate}, &events[0]), CL_SUCCESS);
            queue.fill(fMemory, ++value, after(events[0]), &events[1]);
            EXPECT_EQ(queue.release(fMemory, after(events[1]), &events[2]), CL_SUCCESS);
            clFlush(queue);
        });
        std::this_thread::sleep_for(kSettled);
        for (const Event& event : events)
            EXPECT_GT(statusOf(event), CL_COMPLETE);
        EXPECT_EQ(readGl(fBuffer, fCount), before);

        clSetUserEventStatus(gate, CL_COMPLETE);
        EXPECT_EQ(clWaitForEvents(1, events[2].place()), CL_SUCCESS);
        for (const Event& event : events)
            EXPECT_EQ(statusOf(event), CL_COMPLETE);
        EXPECT_EQ(readGl(fBuffer, fCount), Numbers(fCount, value));
    }
}

// cl_khr_gl_event: drawing after a release sees its result, which needs no OpenCL wait. Without the
// extension the call returns at once.
TEST_F(CommandOrderTest, ReleaseReturnsWhenDoneOnlyWithGlContextAndGlEvent)
{
    const Event gate = makeUserEvent();
    ASSERT_EQ(fQueue.acquire(fMemory), CL_SUCCESS);
    fQueue.fill(fMemory, 6, {gate});
    std::jthread opener;
    if (offersGlEvent())
        opener = std::jthread([&] {
            std::this_thread::sleep_for(kSettled);
            clSetUserEventStatus(gate, CL_COMPLETE);
        });
    Event event;
    EXPECT_EQ(fQueue.release(fMemory, {}, &event), CL_SUCCESS);
    if (offersGlEvent()) {
        EXPECT_EQ(statusOf(event), CL_COMPLETE);
    } else {
        EXPECT_GT(statusOf(event), CL_COMPLETE);
        clSetUserEventStatus(gate, CL_COMPLETE);
        clWaitForEvents(1, event.place());
    }
    EXPECT_EQ(readGl(fBuffer, fCount), Numbers(fCount, 6));
}

// The other OpenGL contexts of the process are none of the layer's business.
TEST_F(CommandOrderTest, ContextsOfOtherShareGroupsAreNotWaitedFor)
{
    const Event gate = makeUserEvent();
    ASSERT_EQ(fQueue.acquire(fMemory), CL_SUCCESS);
    const EglTestContext stranger;
    ASSERT_TRUE(stranger.valid());
    onOtherThread([&] {
        stranger.makeCurrent();
        fQueue.fill(fMemory, 6, {gate});
        Event event;
        EXPECT_EQ(fQueue.release(fMemory, {}, &event), CL_SUCCESS);
        EXPECT_GT(statusOf(event), CL_COMPLETE);
        EglTestContext::releaseCurrent();
    });
    clSetUserEventStatus(gate, CL_COMPLETE);
    clFinish(fQueue);
}

TEST_F(CommandOrderTest, UserSynchronisationSwitchesTheImpliedOrderOff)
{
    fGlEntries.insert(fGlEntries.end(), {CL_CONTEXT_INTEROP_USER_SYNC, CL_TRUE});
    const Context context = makeContext();
    const Queue queue(context, fDevice);
    const Memory memory = share(context, fBuffer);
    const Event gate = clCreateUserEvent(context, nullptr);
    Event event;
    EXPECT_EQ(queue.acquire(memory, {gate}), CL_SUCCESS);
    EXPECT_EQ(queue.release(memory, {}, &event), CL_SUCCESS);
    EXPECT_GT(statusOf(event), CL_COMPLETE);
    clSetUserEventStatus(gate, CL_COMPLETE);
    EXPECT_EQ(clWaitForEvents(1, event.place()), CL_SUCCESS);
}

// A target of kSide times kSide pixels.
constexpr GLsizei kSide = 1024;
constexpr std::size_t kPixels = std::size_t{kSide} * kSide;

// Draws so many times over the target. Each pixel's fragment writes -1 to its own place in the
// buffer. Nothing waits for it, nor flushes.
void drawIntoBuffer(GLuint pixels, int times)
{
    GLuint frame = 0;
    GLuint vertices = 0;
    glGenFramebuffers(1, &frame);
    glBindFramebuffer(GL_FRAMEBUFFER, frame);
    glFramebufferParameteri(GL_FRAMEBUFFER, GL_FRAMEBUFFER_DEFAULT_WIDTH, kSide);
    glFramebufferParameteri(GL_FRAMEBUFFER, GL_FRAMEBUFFER_DEFAULT_HEIGHT, kSide);
    glGenVertexArrays(1, &vertices);
    glBindVertexArray(vertices);
    glBindBufferBase(GL_SHADER_STORAGE_BUFFER, 0, pixels);
    glFinish();
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
    glUniform1i(0, kSide);
    glViewport(0, 0, kSide, kSide);
    for (int i = 0; i < times; ++i)
        glDrawArrays(GL_TRIANGLES, 0, 3);
}

// Results of drawing that nobody has waited for, but the implied order.
TEST_F(GlEventTest, AcquireComesAfterPendingDrawing)
{
    const GLuint pixels = makeGlBuffer(Numbers(kPixels, 0));
    const Memory memory = share(pixels);
    drawIntoBuffer(pixels, 1);

    EXPECT_EQ(fQueue.acquire(memory), CL_SUCCESS);
    EXPECT_TRUE(fQueue.read(memory, kPixels) == Numbers(kPixels, -1));
    EXPECT_EQ(fQueue.release(memory), CL_SUCCESS);
}

// The failure of what it waits for is the command's own, in a queue of either kind.
TEST_F(CommandOrderTest, FailedWaitListsFailTheCommand)
{
    for (const cl_command_queue_properties kind : kQueueKinds) {
        SCOPED_TRACE(kind);
        const Queue queue(fContext, fDevice, kind);
        const Memory memory = share(fBuffer);
        const Event gate = makeUserEvent();
        const Event other = makeUserEvent();
        Event event;
        onOtherThread([&] {
            EXPECT_EQ(queue.acquire(memory, {gate, other}, &event), CL_SUCCESS);
            clFlush(queue);
        });
        clSetUserEventStatus(gate, -5);
        // Some runtimes fail the command now, and use what waited for the other event again later.
        std::this_thread::sleep_for(2 * kSettled);
        clSetUserEventStatus(other, CL_COMPLETE);
        clWaitForEvents(1, event.place());
        EXPECT_LT(statusOf(event), CL_COMPLETE);
    }
}

decltype(&clCreateEventFromGLsyncKHR) findCreateEvent(cl_platform_id platform)
{
    return reinterpret_cast<decltype(&clCreateEventFromGLsyncKHR)>(
        clGetExtensionFunctionAddressForPlatform(platform, "clCreateEventFromGLsyncKHR"));
}

// The event is all that is left of its context when the drawing ends.
TEST_F(GlEventTest, EventsOfGlSyncObjectsKeepTheirContext)
{
    Context context = makeContext();
    drawIntoBuffer(makeGlBuffer(Numbers(kPixels, 0)), 20);
    GLsync sync = glFenceSync(GL_SYNC_GPU_COMMANDS_COMPLETE, 0);
    glFlush();
    Event event = findCreateEvent(fPlatform)(context, reinterpret_cast<cl_GLsync>(sync), nullptr);
    context = nullptr;
    EXPECT_EQ(clWaitForEvents(1, event.place()), CL_SUCCESS);
    EXPECT_EQ(statusOf(event), CL_COMPLETE);
    glDeleteSync(sync);
}

TEST_F(GlEventTest, EventsFollowGlSyncObjects)
{
    const auto createEvent = findCreateEvent(fPlatform);
    ASSERT_NE(createEvent, nullptr);
    redraw(fBuffer, from(40));
    GLsync sync = glFenceSync(GL_SYNC_GPU_COMMANDS_COMPLETE, 0);
    glFlush();
    cl_int error = CL_INVALID_VALUE;
    const Event event = createEvent(fContext, reinterpret_cast<cl_GLsync>(sync), &error);
    ASSERT_EQ(error, CL_SUCCESS);
    EXPECT_EQ(infoOf<cl_command_type>(clGetEventInfo, event, CL_EVENT_COMMAND_TYPE),
              cl_command_type{CL_COMMAND_GL_FENCE_SYNC_OBJECT_KHR});
    EXPECT_EQ(clSetUserEventStatus(event, CL_COMPLETE), CL_INVALID_EVENT);

    onOtherThread([&] {
        EXPECT_EQ(fQueue.acquire(fMemory, {event}), CL_SUCCESS);
        EXPECT_EQ(fQueue.read(fMemory, fCount), from(40));
        EXPECT_EQ(fQueue.release(fMemory), CL_SUCCESS);
    });
    glDeleteSync(sync);
    EXPECT_EQ(createEvent(fContext, reinterpret_cast<cl_GLsync>(this), &error), nullptr);
    EXPECT_EQ(error, CL_INVALID_GL_OBJECT);
}

} // namespace
