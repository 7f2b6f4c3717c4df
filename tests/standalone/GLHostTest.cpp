#include "GLFixture.h"

#include "host/GLFunctionTable.h"
#include "host/ResourceWindow.h"

#include "standalone/GLHost.h"

#include <QOpenGLExtraFunctions>
#include <QOpenGLShaderProgram>
#include <QOpenGLVertexArrayObject>

#include <dlfcn.h>

#include <atomic>
#include <chrono>
#include <future>
#include <optional>
#include <thread>

namespace {

using namespace std::chrono_literals;
using Clock = std::chrono::steady_clock;

constexpr unsigned int gpuCommandsComplete = GL_SYNC_GPU_COMMANDS_COMPLETE;
constexpr std::uint64_t aSecondNs = 1'000'000'000;

// The result of `function`, run on a thread that has no OpenGL context.
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
        if (IsSkipped()) {
            return;
        }
        if (window() != nullptr) {
            fHost.emplace(*window());
        } else {
            fHost.emplace(context());
        }
        if (!fHost->syncObjectsUsable()) {
            GTEST_SKIP() << "this OpenGL has no sync objects";
        }
    }

    void TearDown() override
    {
        fHost.reset();
        GLTest::TearDown();
    }

    static GLFunctionTable& table() { return *GLFunctionTable::fpGlobalFunctionTable; }
    QOpenGLExtraFunctions& gl() const { return *context().extraFunctions(); }
    bool isSync(GLsync sync) const { return gl().glIsSync(sync) == GL_TRUE; }

    std::optional<GLHost> fHost;
};

class GLHostAnyContext : public GLHostTest {};
INSTANTIATE_TEST_SUITE_P(Contexts, GLHostAnyContext, testing::ValuesIn(allGLKinds), nameOf);

TEST_P(GLHostAnyContext, RegistersWhileItLivesAndOnItsThreadOnly)
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

TEST_P(GLHostAnyContext, FencesPassBetweenTheRendererAndForeignThreads)
{
    const GLsync ours = table().glFenceSync(gpuCommandsComplete, 0);
    ASSERT_TRUE(isSync(ours));
    gl().glFlush();
    const unsigned int waited = onForeignThread([ours] {
        table().glWaitSync(ours, 0, GL_TIMEOUT_IGNORED);
        return table().glClientWaitSync(ours, GL_SYNC_FLUSH_COMMANDS_BIT, 10 * aSecondNs);
    });
    EXPECT_TRUE(isSignalled(waited)) << waited;
    onForeignThread([ours] { table().glDeleteSync(ours); });
    EXPECT_FALSE(isSync(ours)) << "not deleted";

    // The other way round, without a flush: a foreign thread has no context to flush.
    const GLsync theirs =
        onForeignThread([] { return table().glFenceSync(gpuCommandsComplete, 0); });
    ASSERT_TRUE(isSync(theirs));
    table().glWaitSync(theirs, 0, GL_TIMEOUT_IGNORED);
    EXPECT_TRUE(isSignalled(table().glClientWaitSync(theirs, 0, 10 * aSecondNs)));
    table().glDeleteSync(theirs);
    EXPECT_FALSE(isSync(theirs));
    EXPECT_EQ(gl().glGetError(), static_cast<GLenum>(GL_NO_ERROR));
}

// A machine's window system has no say in what follows.
class GLHostOnce : public GLHostTest {
protected:
    // Draws for at least `duration`, as far as the GPU is concerned, behind all earlier commands.
    void drawFor(std::chrono::milliseconds duration);

private:
    void draw(float rounds);

    QOpenGLShaderProgram fProgram;
    QOpenGLVertexArrayObject fVertices;
};
INSTANTIATE_TEST_SUITE_P(Contexts, GLHostOnce, testing::Values(GLKind{"xcb_glx", true}), nameOf);

void GLHostOnce::draw(float rounds)
{
    fProgram.setUniformValue("rounds", rounds);
    gl().glDrawArrays(GL_TRIANGLES, 0, 3);
}

void GLHostOnce::drawFor(std::chrono::milliseconds duration)
{
    ASSERT_TRUE(fProgram.addShaderFromSourceCode(QOpenGLShader::Vertex, R"(#version 130
        void main() {
            gl_Position = vec4(4 * (gl_VertexID & 1) - 1, 2 * (gl_VertexID & 2) - 1, 0, 1);
        })"));
    ASSERT_TRUE(fProgram.addShaderFromSourceCode(QOpenGLShader::Fragment, R"(#version 130
        uniform float rounds;
        out vec4 color;
        void main() {
            float x = gl_FragCoord.x;
            for (float i = 0.0; i < rounds; i += 1.0) x = sin(x + i);
            color = vec4(x);
        })"));
    ASSERT_TRUE(fProgram.link() && fProgram.bind() && fVertices.create());
    fVertices.bind();

    // How long a round takes depends on the machine: double until it is long enough.
    float rounds = 100;
    for (auto taken = Clock::duration::zero(); taken < duration; rounds *= 2) {
        const auto start = Clock::now();
        draw(rounds);
        gl().glFinish();
        taken = Clock::now() - start;
    }
    draw(rounds);
}

TEST_P(GLHostOnce, ForeignWaitsTimeOutAndShareTheHiddenContext)
{
    ASSERT_NO_FATAL_FAILURE(drawFor(500ms));
    const GLsync fence = table().glFenceSync(gpuCommandsComplete, 0);
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
    const GLsync other =
        onForeignThread([] { return table().glFenceSync(gpuCommandsComplete, 0); });
    EXPECT_TRUE(waiting.load()) << "the fence came too late";
    waiter.join();
    EXPECT_FALSE(onForeignThread([&] { return timedOut(0); })) << "the wait ended too early";
    table().glDeleteSync(other);
    table().glDeleteSync(fence);
}

TEST_P(GLHostOnce, ContextsOfOtherShareGroupsGoThroughTheHiddenOne)
{
    QOffscreenSurface surface;
    surface.create();
    QOpenGLContext stranger;
    ASSERT_TRUE(stranger.create() && stranger.makeCurrent(&surface));
    const GLsync fence = table().glFenceSync(gpuCommandsComplete, 0);
    EXPECT_EQ(QOpenGLContext::currentContext(), &stranger);
    makeCurrent();
    EXPECT_TRUE(isSync(fence)) << "made in a context that the renderer cannot see";
    table().glDeleteSync(fence);
}

// An OpenCL context of any device, for the sake of its user events. The runtime is opened as the
// library opens it, since the host must find the runtime that is there.
class OpenCLEvents {
public:
    OpenCLEvents() : fLibrary(dlopen("libOpenCL.so.1", RTLD_NOW))
    {
        cl_platform_id platform = nullptr;
        cl_device_id device = nullptr;
        if (fLibrary == nullptr ||
            entry<decltype(clGetPlatformIDs)>("clGetPlatformIDs")(1, &platform, nullptr) != 0 ||
            entry<decltype(clGetDeviceIDs)>("clGetDeviceIDs")(platform, CL_DEVICE_TYPE_ALL, 1,
                                                              &device, nullptr) != 0) {
            return;
        }
        fContext = entry<decltype(clCreateContext)>("clCreateContext")(nullptr, 1, &device, nullptr,
                                                                       nullptr, nullptr);
    }

    ~OpenCLEvents()
    {
        if (fContext != nullptr) {
            entry<decltype(clReleaseContext)>("clReleaseContext")(fContext);
        }
    }

    OpenCLEvents(const OpenCLEvents&) = delete;
    OpenCLEvents& operator=(const OpenCLEvents&) = delete;

    cl_context context() const { return fContext; }

    cl_event create() const
    {
        return entry<decltype(clCreateUserEvent)>("clCreateUserEvent")(fContext, nullptr);
    }

    void end(cl_event event, cl_int status) const
    {
        entry<decltype(clSetUserEventStatus)>("clSetUserEventStatus")(event, status);
    }

    void release(cl_event event) const { entry<decltype(clReleaseEvent)>("clReleaseEvent")(event); }

private:
    template <class Function>
    Function* entry(const char* name) const
    {
        return reinterpret_cast<Function*>(dlsym(fLibrary, name));
    }

    void* fLibrary;
    cl_context fContext = nullptr;
};

TEST_P(GLHostOnce, SyncsFromCLEventsFollowTheEvent)
{
    const OpenCLEvents openCL;
    if (openCL.context() == nullptr) {
        GTEST_SKIP() << "no OpenCL device";
    }
    const cl_event event = openCL.create();
    const auto createSync = [&](cl_event of) {
        return table().glCreateSyncFromCLeventARB(openCL.context(), of, 0);
    };
    const auto signalled = [](GLsync sync) {
        return isSignalled(table().glClientWaitSync(sync, 0, aSecondNs));
    };

    // Either the sync comes late, as the host's own does, or it comes early and unsignalled.
    std::future<bool> early = std::async(std::launch::async, [&] {
        const GLsync sync = createSync(event);
        const bool isSignalledNow = signalled(sync);
        table().glDeleteSync(sync);
        return isSignalledNow;
    });
    EXPECT_EQ(early.wait_for(300ms), std::future_status::timeout) << "signalled before the event";
    openCL.end(event, CL_COMPLETE);
    EXPECT_TRUE(early.get());

    const GLsync here = createSync(event);
    EXPECT_TRUE(isSync(here));
    EXPECT_TRUE(signalled(here));
    table().glDeleteSync(here);

    // A command that failed has ended too.
    const cl_event failed = openCL.create();
    openCL.end(failed, CL_OUT_OF_RESOURCES);
    const GLsync ofFailed = onForeignThread([&] { return createSync(failed); });
    EXPECT_TRUE(isSync(ofFailed));
    table().glDeleteSync(ofFailed);

    EXPECT_EQ(createSync(nullptr), nullptr);
    EXPECT_EQ(table().glCreateSyncFromCLeventARB(openCL.context(), event, 1), nullptr);
    openCL.release(failed);
    openCL.release(event);
}

} // namespace
