// The order of acquires, releases and the commands and events around them.
#include "SharingTest.h"

#include <array>
#include <chrono>
#include <thread>

namespace {

// Much longer than any command takes: a command that is not complete by then is waiting.
constexpr std::chrono::milliseconds kSettled{100};

constexpr std::array<cl_command_queue_properties, 2> kQueueKinds{
    0, CL_QUEUE_OUT_OF_ORDER_EXEC_MODE_ENABLE};

using CommandOrderTest = SharingTest;

// Tests of cl_khr_gl_event, which run only where it is enabled.
using GlEventTest = SharingTest;

// On a thread without an OpenGL context, the calls do not wait. In an out-of-order queue, later
// commands wait by events.
TEST_F(CommandOrderTest, CommandsWaitForTheirListAndDelayLaterCommands)
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
        EXPECT_EQ(clWaitForEvents(1, events[2].address()), CL_SUCCESS);
        for (const Event& event : events)
            EXPECT_EQ(statusOf(event), CL_COMPLETE);
        EXPECT_EQ(readGl(fBuffer, fCount), Numbers(fCount, value));
    }
}

// With cl_khr_gl_event, OpenGL commands after a release read its result without an OpenCL wait.
TEST_F(CommandOrderTest, ReleaseWithCurrentContextReturnsWhenCompleteOnlyWithGlEvent)
{
    const Event gate = makeUserEvent();
    ASSERT_EQ(fQueue.acquire(fMemory), CL_SUCCESS);
    fQueue.fill(fMemory, 6, {gate});
    std::jthread opener;
    if (offersGlEvent()) {
        opener = std::jthread([&] {
            std::this_thread::sleep_for(kSettled);
            clSetUserEventStatus(gate, CL_COMPLETE);
        });
    }
    Event event;
    EXPECT_EQ(fQueue.release(fMemory, {}, &event), CL_SUCCESS);
    if (offersGlEvent()) {
        EXPECT_EQ(statusOf(event), CL_COMPLETE);
    } else {
        EXPECT_GT(statusOf(event), CL_COMPLETE);
        clSetUserEventStatus(gate, CL_COMPLETE);
        clWaitForEvents(1, event.address());
    }
    EXPECT_EQ(readGl(fBuffer, fCount), Numbers(fCount, 6));
}

// Either the OpenCL context has CL_CONTEXT_INTEROP_USER_SYNC, or the current OpenGL context belongs
// to another share group.
TEST_F(CommandOrderTest, ReleaseWithUserSyncOrAnotherShareGroupReturnsAtOnce)
{
    const EglTestContext stranger;
    ASSERT_TRUE(stranger.valid());
    for (const bool hasUserSync : {false, true}) {
        SCOPED_TRACE(hasUserSync);
        Properties entries = fGlEntries;
        if (hasUserSync)
            entries.insert(entries.end(), {CL_CONTEXT_INTEROP_USER_SYNC, CL_TRUE});
        const Context context = makeContext(properties(entries));
        const Queue queue(context, fDevice);
        const Memory memory = share(context, fBuffer);
        const Event gate = clCreateUserEvent(context, nullptr);
        Event event;
        (hasUserSync ? *fGl : stranger).makeCurrent();
        EXPECT_EQ(queue.acquire(memory, {gate}), CL_SUCCESS);
        EXPECT_EQ(queue.release(memory, {}, &event), CL_SUCCESS);
        EXPECT_GT(statusOf(event), CL_COMPLETE);
        clSetUserEventStatus(gate, CL_COMPLETE);
        EXPECT_EQ(clWaitForEvents(1, event.address()), CL_SUCCESS);
        fGl->makeCurrent();
    }
}

constexpr GLsizei kSide = 1024; // pixels of the render target's width and height
constexpr std::size_t kPixels = std::size_t{kSide} * kSide;

// Draws the whole target `times` times. Each fragment writes -1 to the number of its pixel. Neither
// waits nor flushes.
void drawIntoBuffer(GLuint pixels, int times)
{
    bindEmptyFramebuffer(kSide);
    glBindBufferBase(GL_SHADER_STORAGE_BUFFER, 0, pixels);
    glFinish();
    const char* vertex =
        "#version 450\nout gl_PerVertex { vec4 gl_Position; }; void main() { gl_Position = "
        "vec4(gl_VertexID == 1 ? 3 : -1, gl_VertexID == 2 ? 3 : -1, 0, 1); }";
    const char* fragment =
        "#version 450\nlayout(std430, binding = 0) buffer Numbers { int numbers[]; }; void main() "
        "{ numbers[int(gl_FragCoord.y) * 1024 + int(gl_FragCoord.x)] = -1; }";
    GLuint pipeline = 0;
    glGenProgramPipelines(1, &pipeline);
    glUseProgramStages(pipeline, GL_VERTEX_SHADER_BIT,
                       glCreateShaderProgramv(GL_VERTEX_SHADER, 1, &vertex));
    glUseProgramStages(pipeline, GL_FRAGMENT_SHADER_BIT,
                       glCreateShaderProgramv(GL_FRAGMENT_SHADER, 1, &fragment));
    glBindProgramPipeline(pipeline);
    glViewport(0, 0, kSide, kSide);
    for (int i = 0; i < times; ++i)
        glDrawArrays(GL_TRIANGLES, 0, 3);
}

TEST_F(GlEventTest, AcquireAfterPendingDrawingReadsItsResult)
{
    const GLuint pixels = makeGlBuffer(Numbers(kPixels, 0));
    const Memory memory = share(pixels);
    drawIntoBuffer(pixels, 1);

    EXPECT_EQ(fQueue.acquire(memory), CL_SUCCESS);
    EXPECT_TRUE(fQueue.read(memory, kPixels) == Numbers(kPixels, -1));
    EXPECT_EQ(fQueue.release(memory), CL_SUCCESS);
}

TEST_F(CommandOrderTest, FailedWaitListFailsTheCommand)
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
        // Some runtimes fail the command now, and use its event again when `other` completes.
        std::this_thread::sleep_for(2 * kSettled);
        clSetUserEventStatus(other, CL_COMPLETE);
        clWaitForEvents(1, event.address());
        EXPECT_LT(statusOf(event), CL_COMPLETE);
    }
}

decltype(&clCreateEventFromGLsyncKHR) findCreateEvent(cl_platform_id platform)
{
    return reinterpret_cast<decltype(&clCreateEventFromGLsyncKHR)>(
        clGetExtensionFunctionAddressForPlatform(platform, "clCreateEventFromGLsyncKHR"));
}

// The event is the last object of its context.
TEST_F(GlEventTest, SyncEventCompletesAfterItsContextIsReleased)
{
    Context context = makeContext();
    drawIntoBuffer(makeGlBuffer(Numbers(kPixels, 0)), 20);
    GLsync sync = glFenceSync(GL_SYNC_GPU_COMMANDS_COMPLETE, 0);
    glFlush();
    Event event = findCreateEvent(fPlatform)(context, reinterpret_cast<cl_GLsync>(sync), nullptr);
    context = nullptr;
    EXPECT_EQ(clWaitForEvents(1, event.address()), CL_SUCCESS);
    EXPECT_EQ(statusOf(event), CL_COMPLETE);
    glDeleteSync(sync);
}

TEST_F(GlEventTest, SyncEventCompletesWithItsSyncObject)
{
    const auto createEvent = findCreateEvent(fPlatform);
    ASSERT_NE(createEvent, nullptr);
    overwrite(fBuffer, from(40));
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
