// The end of the process, which must neither crash nor hang. Each test runs in a process of its
// own.
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

// The objects of a test, in order of their creation.
struct TestObjects {
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

// The objects that the test has left. Never destroyed by the program.
TestObjects& theObjects()
{
    static auto* const theOne = new TestObjects;
    return *theOne;
}

// Releases at exit, after the exit handlers that were registered later.
std::unique_ptr<TestObjects, void (*)(TestObjects*)> theOwner(nullptr, [](TestObjects* objects) {
    objects->closeCl();
});

// The number that a copy writes last; 0 before.
const volatile cl_int* theLastOfCopy = nullptr;

class ExitOrder : public SharingTest {
protected:
    // The buffer is large enough to be unmapped when it is freed.
    ExitOrder() : SharingTest(std::size_t{1} << 18)
    {
        std::atexit([] { // runs after the layer's exit handler
            if (theLastOfCopy != nullptr && *theLastOfCopy == 0)
                _exit(1);
        });
    }

    void SetUp() override
    {
        ASSERT_NO_FATAL_FAILURE(SharingTest::SetUp());
        if (IsSkipped())
            return;
        ASSERT_NO_FATAL_FAILURE(fQueue.rewrite(fMemory, from(1), from(2)));
        theObjects() = {std::move(fGl), std::move(fContext), std::move(fQueue), std::move(fMemory)};
    }
};

TEST_F(ExitOrder, ExitWithNothingReleasedSucceeds) {}

TEST_F(ExitOrder, ExitWithAllReleasedSucceeds)
{
    theObjects().closeCl();
    theObjects().closeGl();
}

TEST_F(ExitOrder, ReleaseAfterGlIsClosedSucceeds)
{
    theObjects().closeGl();
    // May succeed or fail, depending on whether the driver keeps its objects.
    theObjects().queue.acquire(theObjects().memory);
    theObjects().queue.release(theObjects().memory);
    theObjects().closeCl();
}

TEST_F(ExitOrder, ReleaseByStaticDestructorSucceeds)
{
    theOwner.reset(&theObjects());
}

// The layer's exit handler runs between the two.
TEST_F(ExitOrder, GlClosedInExitHandlerSucceeds)
{
    std::atexit([] { theObjects().closeGl(); });
    theOwner.reset(&theObjects());
}

TEST_F(ExitOrder, ExitWithPendingCommandsSucceeds)
{
    EglTestContext::releaseCurrent();
    cl_event gate = clCreateUserEvent(theObjects().context, nullptr);
    EXPECT_EQ(theObjects().queue.acquire(theObjects().memory, {gate}), CL_SUCCESS);
    EXPECT_EQ(theObjects().queue.release(theObjects().memory), CL_SUCCESS);
    clFlush(theObjects().queue);
}

TEST_F(ExitOrder, ExitWaitsForCopyInProgress)
{
    if (isZeroCopy())
        GTEST_SKIP() << "nothing is copied";
    constexpr std::size_t kCount = std::size_t{1} << 24; // copied in some milliseconds
    const Queue& queue = theObjects().queue;
    theObjects().memory = share(theObjects().context, makeGlBuffer(numbersFrom(1, kCount)));
    auto* const copy = static_cast<volatile cl_int*>(
        clEnqueueMapBuffer(queue, theObjects().memory, CL_TRUE, CL_MAP_READ | CL_MAP_WRITE, 0,
                           kCount * sizeof(cl_int), 0, nullptr, nullptr, nullptr));
    ASSERT_NE(copy, nullptr);
    copy[0] = 0;
    copy[kCount - 1] = 0;
    EXPECT_EQ(queue.acquire(theObjects().memory), CL_SUCCESS);
    clFlush(queue);
    if (!becomesTrue([&] { return copy[0] != 0; }))
        GTEST_SKIP() << "the runtime does not copy into mapped memory";
    theLastOfCopy = copy + kCount - 1;
    std::exit(HasFailure() ? 1 : 0);
}

// Acquires and releases until the process ends, on a thread without an OpenGL context.
void startBusyThread()
{
    std::thread([] {
        for (;;) {
            theObjects().queue.acquire(theObjects().memory);
            theObjects().queue.release(theObjects().memory);
            clFinish(theObjects().queue);
        }
    }).detach();
}

TEST_F(ExitOrder, ExitDuringCommandsOfAnotherThreadSucceeds)
{
    EglTestContext::releaseCurrent();
    startBusyThread();
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
}

// Expects the functions that need threads to fail in a forked child, and not to wait.
void useInChild(cl_device_id device, const Properties& list)
{
    const TestObjects& parent = theObjects();
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

// The children are forked during commands of another thread.
TEST_F(ExitOrder, ForkedChildReturnsOutOfResourcesAndExits)
{
#ifdef GLSHARE_TEST_SANITIZED
    GTEST_SKIP() << "the sanitizers' allocators may stay locked in a child";
#endif
    std::array<char, 64> vendor{};
    clGetPlatformInfo(fPlatform, CL_PLATFORM_VENDOR, vendor.size(), vendor.data(), nullptr);
    if (std::string_view(vendor.data()) == "Mesa/X.org")
        GTEST_SKIP() << "an exit handler of Mesa's runtime crashes in a forked child";
    constexpr int kChildren = 20;
    constexpr unsigned kTimeout = 30; // seconds, after which the system ends a child
    EglTestContext::releaseCurrent();
    startBusyThread();
    for (int i = 0; i < kChildren; ++i) {
        const pid_t child = fork();
        if (child == 0) {
            alarm(kTimeout);
            if (i % 2 != 0)
                useInChild(fDevice, properties());
            std::exit(HasFailure() ? 1 : 0);
        }
        int status = 0;
        ASSERT_EQ(waitpid(child, &status, 0), child);
        ASSERT_EQ(status, 0) << "child " << i;
    }
}

TEST_F(ExitOrder, ExitOnAnotherThreadSucceeds)
{
    onOtherThread([] { std::exit(HasFailure() ? 1 : 0); });
}

} // namespace
