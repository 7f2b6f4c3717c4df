#include "GLFixture.h"

#include "host/GLFunctionTable.h"
#include "host/ResourceWindow.h"

#include "standalone/GLHost.h"

#include <CL/cl.h>
#include <QOpenGLExtraFunctions>
#include <QOpenGLShaderProgram>
#include <QOpenGLVertexArrayObject>

#include <atomic>
#include <chrono>
#include <future>
#include <optional>
#include <thread>

namespace {

using namespace std::chrono_literals;
using Clock = std::chrono::steady_clock;

constexpr std::uint64_t kOneSecondNs = 1'000'000'000;

// Returns the result of `function`, run on a thread that has no OpenGL context.
template <class Function>
auto onForeignThread(Function function)
{
    return std::async(std::launch::async, std::move(function)).get();
}

bool isSignalled(unsigned int waitResult)
{
    return waitResult == GL_ALREADY_SIGNALED || waitResult == GL_CONDITION_SATISFIED;
}

class GLHostTest : public GLTest {
protected:
    void SetUp() override
    {
        GLTest::SetUp();
        if (IsSkipped())
            return;
        if (window() != nullptr)
            fHost.emplace(*window());
        else
            fHost.emplace(context());
        if (!fHost->syncObjectsUsable())
            GTEST_SKIP() << "this OpenGL has no sync objects";
    }

    static GLFunctionTable& table() { return *GLFunctionTable::fpGlobalFunctionTable; }
    static GLsync makeFence() { return table().glFenceSync(GL_SYNC_GPU_COMMANDS_COMPLETE, 0); }
    QOpenGLExtraFunctions& gl() const { return *context().extraFunctions(); }
    bool isSync(GLsync sync) const { return gl().glIsSync(sync) == GL_TRUE; }

    std::optional<GLHost> fHost;
};

using GLHostAnyContext = GLHostTest;
INSTANTIATE_TEST_SUITE_P(Contexts, GLHostAnyContext, kAllGLKinds, nameOf);

TEST_P(GLHostAnyContext, ConstructorRegistersOnItsThreadUntilDestruction)
{
    ASSERT_NE(GLFunctionTable::fpGlobalFunctionTable, nullptr);
    EXPECT_TRUE(table().syncObjectsUsable());
    EXPECT_TRUE(table().syncFromCLEventUsable());
    EXPECT_TRUE(fHost->syncFromCLEventUsable());
    EXPECT_EQ(Q3dPort::resourceWindow(), window());
    EXPECT_EQ(onForeignThread(Q3dPort::resourceWindow), nullptr);
    EXPECT_EQ(QOpenGLContext::currentContext(), &context()) << "the renderer lost its context";

    fHost.reset();
    EXPECT_EQ(GLFunctionTable::fpGlobalFunctionTable, nullptr);
    EXPECT_EQ(Q3dPort::resourceWindow(), nullptr);
}

TEST_P(GLHostAnyContext, FencesWorkAcrossThreads)
{
    const GLsync ours = makeFence();
    ASSERT_TRUE(isSync(ours));
    gl().glFlush();
    const unsigned int waited = onForeignThread([ours] {
        table().glWaitSync(ours, 0, GL_TIMEOUT_IGNORED);
        return table().glClientWaitSync(ours, GL_SYNC_FLUSH_COMMANDS_BIT, 10 * kOneSecondNs);
    });
    EXPECT_TRUE(isSignalled(waited)) << waited;
    onForeignThread([ours] { table().glDeleteSync(ours); });
    EXPECT_FALSE(isSync(ours)) << "not deleted";

    // In the other direction, without a flush: a foreign thread has no context to flush.
    const GLsync theirs = onForeignThread(makeFence);
    ASSERT_TRUE(isSync(theirs));
    table().glWaitSync(theirs, 0, GL_TIMEOUT_IGNORED);
    EXPECT_TRUE(isSignalled(table().glClientWaitSync(theirs, 0, 10 * kOneSecondNs)));
    table().glDeleteSync(theirs);
    EXPECT_FALSE(isSync(theirs));
    EXPECT_EQ(gl().glGetError(), static_cast<GLenum>(GL_NO_ERROR));
}

// The following tests do not depend on the window system.
using GLHostOnce = GLHostTest;
INSTANTIATE_TEST_SUITE_P(Contexts, GLHostOnce, testing::Values(GLKind("xcb_glx", true)), nameOf);

// Enqueues drawing that takes the GPU at least `duration`, after all earlier commands.
void drawFor(QOpenGLExtraFunctions& gl, std::chrono::milliseconds duration)
{
    QOpenGLShaderProgram program;
    QOpenGLVertexArrayObject vertices;
    ASSERT_TRUE(program.addShaderFromSourceCode(QOpenGLShader::Vertex, R"(#version 130
        void main() {
            gl_Position = vec4(4 * (gl_VertexID & 1) - 1, 2 * (gl_VertexID & 2) - 1, 0, 1);
        })"));
    ASSERT_TRUE(program.addShaderFromSourceCode(QOpenGLShader::Fragment, R"(#version 130
        uniform float rounds;
        out vec4 color;
        void main() {
            float x = gl_FragCoord.x;
            for (float i = 0.0; i < rounds; i += 1.0) x = sin(x + i);
            color = vec4(x);
        })"));
    ASSERT_TRUE(program.link() && program.bind() && vertices.create());
    vertices.bind();
    float rounds = 100;
    const auto draw = [&] {
        program.setUniformValue("rounds", rounds);
        gl.glDrawArrays(GL_TRIANGLES, 0, 3);
    };
    // The time of a round depends on the machine: double the work until it suffices.
    for (auto taken = Clock::duration::zero(); taken < duration; rounds *= 2) {
        const auto start = Clock::now();
        draw();
        gl.glFinish();
        taken = Clock::now() - start;
    }
    draw();
}

TEST_P(GLHostOnce, ForeignWaitsTimeOutAndShareHiddenContext)
{
    ASSERT_NO_FATAL_FAILURE(drawFor(gl(), 500ms));
    const GLsync fence = makeFence();
    gl().glFlush();
    const auto begun = Clock::now();
    const auto timedOut = [fence](std::uint64_t timeoutNs) {
        return table().glClientWaitSync(fence, 0, timeoutNs) == GL_TIMEOUT_EXPIRED;
    };
    EXPECT_TRUE(onForeignThread([&] { return timedOut(0); }));
    EXPECT_TRUE(onForeignThread([&] { return timedOut(20'500'000); }));
    EXPECT_GE(Clock::now() - begun, 20'500us);

    // While one thread waits without limit, another gets its fence.
    std::atomic<bool> waiting = true;
    std::jthread waiter([&] {
        table().glWaitSync(fence, 0, GL_TIMEOUT_IGNORED);
        waiting = false;
    });
    const GLsync other = onForeignThread(makeFence);
    EXPECT_TRUE(waiting.load()) << "the fence was created too late";
    waiter.join();
    EXPECT_FALSE(onForeignThread([&] { return timedOut(0); })) << "the wait ended too early";
    table().glDeleteSync(other);
    table().glDeleteSync(fence);
}

TEST_P(GLHostOnce, ContextsOfOtherShareGroupsUseHiddenContext)
{
    QOffscreenSurface surface;
    surface.create();
    QOpenGLContext stranger;
    ASSERT_TRUE(stranger.create() && stranger.makeCurrent(&surface));
    const GLsync fence = makeFence();
    EXPECT_EQ(QOpenGLContext::currentContext(), &stranger);
    makeCurrent();
    EXPECT_TRUE(isSync(fence)) << "created in a context that does not share with the renderer";
    table().glDeleteSync(fence);
}

TEST_P(GLHostOnce, SyncFromCLEventFollowsEvent)
{
    cl_platform_id platform = nullptr;
    cl_device_id device = nullptr;
    if (clGetPlatformIDs(1, &platform, nullptr) != CL_SUCCESS ||
        clGetDeviceIDs(platform, CL_DEVICE_TYPE_ALL, 1, &device, nullptr) != CL_SUCCESS)
        GTEST_SKIP() << "no OpenCL device";
    const cl_context openCL = clCreateContext(nullptr, 1, &device, nullptr, nullptr, nullptr);
    const cl_event event = clCreateUserEvent(openCL, nullptr);
    const auto createSync = [&](cl_event of) {
        return table().glCreateSyncFromCLeventARB(openCL, of, 0);
    };
    // Deletes it too.
    const auto signals = [](GLsync sync) {
        const bool isSignalledNow = isSignalled(table().glClientWaitSync(sync, 0, kOneSecondNs));
        table().glDeleteSync(sync);
        return isSignalledNow;
    };

    // The sync object is returned after the event (as the host's own), or earlier and unsignalled.
    auto early = std::async(std::launch::async, [&] { return signals(createSync(event)); });
    EXPECT_EQ(early.wait_for(300ms), std::future_status::timeout) << "signalled before the event";
    clSetUserEventStatus(event, CL_COMPLETE);
    EXPECT_TRUE(early.get());
    const GLsync here = createSync(event);
    EXPECT_TRUE(isSync(here));
    EXPECT_TRUE(signals(here));

    // A failed command has ended, too.
    const cl_event failed = clCreateUserEvent(openCL, nullptr);
    clSetUserEventStatus(failed, CL_OUT_OF_RESOURCES);
    const GLsync ofFailed = onForeignThread([&] { return createSync(failed); });
    EXPECT_TRUE(isSync(ofFailed));
    table().glDeleteSync(ofFailed);

    EXPECT_EQ(createSync(nullptr), nullptr);
    EXPECT_EQ(table().glCreateSyncFromCLeventARB(openCL, event, 1), nullptr);
    clReleaseEvent(failed);
    clReleaseEvent(event);
    clReleaseContext(openCL);
}

} // namespace
