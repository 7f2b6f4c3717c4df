// What is kept, and for how long, when things go in any order.
// Before the headers of the tests, as it includes those of the newest OpenCL.
#include "core/api/OpenCl.h"

#include "SharingTest.h"
#include "StressRounds.h"

#include <malloc.h>
#include <unistd.h>

#include <fstream>

namespace {

class LifetimeTest : public SharingTest {
protected:
    LifetimeTest() : SharingTest(100000) {}
};

TEST_F(LifetimeTest, ContextsTakeTheirWorkerAlong)
{
    const std::ptrdiff_t before = threadsOfProcess();
    for (int i = 0; i < 20; ++i) {
        const Context context = makeContext();
        clRetainContext(context);
        clReleaseContext(context);
        const GLuint buffer = makeGlBuffer(numbersFrom(0, 10));
        share(context, buffer);
        glDeleteBuffers(1, &buffer);
    }
    // Threads of what was there before may have ended in the meantime.
    EXPECT_TRUE(isSoon([&] { return threadsOfProcess() <= before; }));
}

// Names are given again from the lowest free one on.
TEST_F(LifetimeTest, ContextsLeaveNoObjectsInTheShareGroup)
{
    fQueue.rewrite(fMemory, from(1), from(2));
    fMemory = nullptr;
    fQueue = Queue();
    fContext = nullptr;
    // A thread of the runtime may release the last reference.
    const auto isClean = [this] {
        for (GLuint name = 1; name < 20; ++name) {
            if (glIsProgram(name) || glIsShader(name) ||
                (glIsBuffer(name) == GL_TRUE) != (name == fBuffer))
                return false;
        }
        return true;
    };
    EXPECT_TRUE(isSoon(isClean));
}

// What the layer keeps for a command whose wait list fails goes with the command.
TEST_F(LifetimeTest, CommandsThatFailLeaveNothing)
{
    EglTestContext::releaseCurrent();
    const Queue queue(fContext, fDevice, CL_QUEUE_OUT_OF_ORDER_EXEC_MODE_ENABLE);
    const auto failOften = [&](int times) {
        for (int i = 0; i < times; ++i) {
            const Event gate = makeUserEvent();
            const Memory memory = share(fBuffer);
            Event event;
            EXPECT_EQ(queue.acquire(memory, {gate}, &event), CL_SUCCESS);
            clSetUserEventStatus(gate, -5);
            clWaitForEvents(1, event.place());
        }
    };
    constexpr int kTimes = 200;
    failOften(kTimes); // until the allocators have what they keep
    const std::size_t before = mallinfo2().uordblks;
    failOften(kTimes * stressRounds(1));
    EXPECT_TRUE(isSoon([&] { return mallinfo2().uordblks < before + std::size_t{kTimes} * 1000; }));
}

// The application's last reference to the context is not the last one.
TEST_F(LifetimeTest, ObjectsOutliveTheReferenceToTheirContext)
{
    fContext = nullptr;
    ASSERT_NO_FATAL_FAILURE(fQueue.rewrite(fMemory, from(1), from(4)));
    EXPECT_EQ(readGl(fBuffer, fCount), from(4));
}

// Any object in a context keeps it, and the context shares as long as it is kept. An older runtime
// does not report the end of a context.
TEST_F(LifetimeTest, AContextSharesAsLongAsAnyObjectKeepsIt)
{
    cl_version version = 0;
    if (clGetPlatformInfo(fPlatform, CL_PLATFORM_NUMERIC_VERSION, sizeof version, &version,
                          nullptr) != CL_SUCCESS)
        GTEST_SKIP() << "the runtime is older than OpenCL 3.0";
    const char* source = "kernel void nothing() {}";
    const std::ptrdiff_t threads = threadsOfProcess();
    for (int kind = 0; kind < 5; ++kind) {
        SCOPED_TRACE(kind);
        Context context = makeContext();
        cl_context handle = context;
        const Queue queue = kind == 0 ? Queue(handle, fDevice) : Queue();
        const Event event = kind == 1 ? clCreateUserEvent(handle, nullptr) : nullptr;
        const Memory plain =
            kind == 2 ? clCreateBuffer(handle, CL_MEM_READ_WRITE, 64, nullptr, nullptr) : nullptr;
        const Owned<cl_program, clReleaseProgram> program =
            kind == 3 ? clCreateProgramWithSource(handle, 1, &source, nullptr, nullptr) : nullptr;
        const Memory shared = kind == 4 ? share(handle, fBuffer) : nullptr;
        context = nullptr;
        const Memory memory = share(handle, fBuffer);
        ASSERT_NO_FATAL_FAILURE(Queue(handle, fDevice).rewrite(memory, from(1), from(1)));
    }
    EXPECT_TRUE(isSoon([&] { return threadsOfProcess() <= threads; })) << "a context is kept";
}

TEST_F(LifetimeTest, ReleasedObjectsFinishTheirCommandsFirst)
{
    const Event gate = makeUserEvent();
    onOtherThread([&] {
        EXPECT_EQ(fQueue.acquire(fMemory, {gate}), CL_SUCCESS);
        fQueue.fill(fMemory, 9);
        EXPECT_EQ(fQueue.release(fMemory), CL_SUCCESS);
        fMemory = nullptr;
        clFlush(fQueue);
    });
    clSetUserEventStatus(gate, CL_COMPLETE);
    clFinish(fQueue);
    EXPECT_EQ(readGl(fBuffer, fCount), Numbers(fCount, 9));
}

// Storage is held as long as the object that lies over it, and no longer.
TEST_F(LifetimeTest, StorageGoesWithTheObject)
{
    const auto residentBytes = [] {
        long total = 0;
        long resident = 0;
        std::ifstream("/proc/self/statm") >> total >> resident;
        EXPECT_GT(resident, 0);
        return resident * sysconf(_SC_PAGESIZE);
    };
    // Large enough that the C library gives each one back to the system at once.
    constexpr std::size_t kLarge = std::size_t{40} << 20;
    const Numbers content(kLarge / sizeof(cl_int), 1);
    const auto rounds = [&](int count) {
        for (int i = 0; i < count; ++i) {
            const GLuint buffer = makeGlBuffer(content);
            const Memory memory = share(buffer);
            glDeleteBuffers(1, &buffer);
        }
        // Storage is given back on another thread; what is asked of it afterwards is answered
        // later.
        share(makeGlBuffer(Numbers(1, 1)));
    };
    rounds(5); // until the allocators have what they keep
    const long before = residentBytes();
    rounds(15);
    EXPECT_LT(residentBytes() - before, static_cast<long>(5 * kLarge));
}

TEST_F(LifetimeTest, SharingGoesOnWithoutTheApplicationsGlContext)
{
    const EglTestContext second(fGl.get());
    ASSERT_TRUE(second.valid());
    fGl->destroy();
    fQueue.rewrite(fMemory, from(1), from(11));
    second.makeCurrent();
    EXPECT_EQ(readGl(fBuffer, fCount), from(11));
    EglTestContext::releaseCurrent();
}

TEST_F(LifetimeTest, AContextCurrentElsewhereCanBeSharedWith)
{
    onOtherThread([&] { share(makeContext(), fBuffer); });
}

} // namespace
