// How a process may end. A crash or a hang on the way out is what these tests look for, so that
// each of them belongs in a process of its own.
#include "SharingTest.h"

#include <array>
#include <chrono>
#include <cstdlib>
#include <string_view>
#include <thread>
#include <utility>

#include <sys/wait.h>
#include <unistd.h>

namespace {

// One of everything, in the order in which it is made.
struct Everything {
    std::unique_ptr<EglTestContext> gl;
    Context context;
    Queue queue;
    Memory memory;

    void closeCl()
    {
        memory = nullptr;
        queue = Queue();
        context = nullptr;
    }

    void closeGl() const
    {
        gl->destroy();
        eglTerminate(EglTestContext::display());
    }
};

// What the test has made and left. Never destroyed by itself.
Everything& theRest()
{
    static auto* const theOne = new Everything;
    return *theOne;
}

// Releases at exit, after the exit handlers that came later than it.
std::unique_ptr<Everything, void (*)(Everything*)> theOwner(nullptr, [](Everything* everything) {
    everything->closeCl();
});

class ExitOrder : public SharingTest {
protected:
    // Large enough to be unmapped when it is freed.
    ExitOrder() : SharingTest(std::size_t{1} << 18) {}

    void SetUp() override
    {
        ASSERT_NO_FATAL_FAILURE(SharingTest::SetUp());
        if (IsSkipped())
            return;
        ASSERT_NO_FATAL_FAILURE(fQueue.rewrite(fMemory, from(1), from(2)));
        theRest() = {std::move(fGl), std::move(fContext), std::move(fQueue), std::move(fMemory)};
    }
};

TEST_F(ExitOrder, NothingReleased) {}

TEST_F(ExitOrder, EverythingReleased)
{
    theRest().closeCl();
    theRest().closeGl();
}

TEST_F(ExitOrder, GlFirst)
{
    theRest().closeGl();
    // May succeed or fail, as the driver keeps its objects or not.
    theRest().queue.acquire(theRest().memory);
    theRest().queue.release(theRest().memory);
    theRest().closeCl();
}

TEST_F(ExitOrder, GlOnly)
{
    theRest().closeGl();
}

TEST_F(ExitOrder, StaticOwner)
{
    theOwner.reset(&theRest());
}

// What the layer has registered itself runs between the two.
TEST_F(ExitOrder, GlInAHandlerAndStaticOwner)
{
    std::atexit([] { theRest().closeGl(); });
    theOwner.reset(&theRest());
}

TEST_F(ExitOrder, PendingCommands)
{
    EglTestContext::releaseCurrent();
    cl_event gate = clCreateUserEvent(theRest().context, nullptr);
    EXPECT_EQ(theRest().queue.acquire(theRest().memory, {gate}), CL_SUCCESS);
    EXPECT_EQ(theRest().queue.release(theRest().memory), CL_SUCCESS);
    clFlush(theRest().queue);
}

// Acquires and releases without end, on a thread without an OpenGL context.
void keepBusy()
{
    std::thread([] {
        for (;;) {
            theRest().queue.acquire(theRest().memory);
            theRest().queue.release(theRest().memory);
            clFinish(theRest().queue);
        }
    }).detach();
}

// The process ends while another thread is in the middle of its work.
TEST_F(ExitOrder, BusyThread)
{
    EglTestContext::releaseCurrent();
    keepBusy();
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
}

// Each function that needs what a forked child lacks reports that, and does not wait for it.
void useInChild(cl_device_id device, const Properties& list)
{
    const Everything& parent = theRest();
    cl_mem memory = parent.memory;
    cl_event event = nullptr;
    cl_mem_flags flags = 0;
    cl_int error = CL_SUCCESS;
    EXPECT_EQ(parent.queue.acquire(memory), CL_OUT_OF_RESOURCES);
    EXPECT_EQ(parent.queue.release(memory), CL_OUT_OF_RESOURCES);
    EXPECT_EQ(clGetMemObjectInfo(memory, CL_MEM_FLAGS, sizeof flags, &flags, nullptr),
              CL_OUT_OF_RESOURCES);
    EXPECT_EQ(clCreateFromGLBuffer(parent.context, CL_MEM_READ_WRITE, 1, &error), nullptr);
    EXPECT_EQ(std::exchange(error, CL_SUCCESS), CL_OUT_OF_RESOURCES);
    EXPECT_EQ(clCreateContext(list.data(), 1, &device, nullptr, nullptr, &error), nullptr);
    EXPECT_EQ(std::exchange(error, CL_SUCCESS), CL_OUT_OF_RESOURCES);
    EXPECT_EQ(clRetainEvent(event), CL_OUT_OF_RESOURCES);
    EXPECT_EQ(clRetainContext(parent.context), CL_OUT_OF_RESOURCES);
    EXPECT_EQ(clReleaseContext(parent.context), CL_OUT_OF_RESOURCES);
    EXPECT_EQ(clGetDeviceInfo(device, CL_DEVICE_TYPE, sizeof flags, &flags, nullptr), CL_SUCCESS);
}

// Children that are forked in the middle of other threads' work.
TEST_F(ExitOrder, ForkedChildrenFailToShareAndCanExit)
{
#ifdef GLSHARE_TEST_SANITIZED
    GTEST_SKIP() << "the allocators of the sanitizers can stay locked in a child";
#endif
    std::array<char, 64> vendor{};
    clGetPlatformInfo(fPlatform, CL_PLATFORM_VENDOR, vendor.size(), vendor.data(), nullptr);
    if (std::string_view(vendor.data()) == "Mesa/X.org")
        GTEST_SKIP() << "an exit handler of Mesa's runtime crashes in a forked child";
    constexpr int kChildren = 20;
    constexpr unsigned kPatience = 30; // seconds, after which the system ends a child
    EglTestContext::releaseCurrent();
    keepBusy();
    for (int i = 0; i < kChildren; ++i) {
        const pid_t child = fork();
        if (child == 0) {
            alarm(kPatience);
            if (i % 2 != 0)
                useInChild(fDevice, properties());
            std::exit(HasFailure() ? 1 : 0);
        }
        int status = 0;
        ASSERT_EQ(waitpid(child, &status, 0), child);
        ASSERT_EQ(status, 0) << "child " << i;
    }
}

TEST_F(ExitOrder, ExitOnOtherThread)
{
    onOtherThread([] { std::exit(HasFailure() ? 1 : 0); });
}

} // namespace
