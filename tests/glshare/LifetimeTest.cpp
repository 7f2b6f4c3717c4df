// The lifetime of contexts, buffers, commands and storage, released in any order.
// First, since it includes the newest OpenCL headers.
#include "core/api/OpenCl.h"

#include "SharingTest.h"

#include <chrono>
#include <fstream>
#include <thread>

#include <unistd.h>

namespace {

class LifetimeTest : public SharingTest {
protected:
    LifetimeTest() : SharingTest(100000) {}
};

TEST_F(LifetimeTest, ReleasedContextEndsItsThread)
{
    const std::ptrdiff_t before = threadCount();
    for (int i = 0; i < 20; ++i) {
        const Context context = makeContext();
        clRetainContext(context);
        clReleaseContext(context);
        const GLuint buffer = makeGlBuffer(numbersFrom(0, 10));
        share(context, buffer);
        glDeleteBuffers(1, &buffer);
    }
    // Other threads may have ended in the meantime.
    EXPECT_TRUE(becomesTrue([&] { return threadCount() <= before; }));
}

// OpenGL returns the lowest free name first.
TEST_F(LifetimeTest, ReleasedContextLeavesNoOpenGlObjects)
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
    EXPECT_TRUE(becomesTrue(isClean));
}

// Some runtimes use the events of a failed command again. The layer keeps them until the
// application has released the command's event, and for a moment if it has none. Each event refers
// to the queue.
TEST_F(LifetimeTest, FailedCommandKeepsItsEventsAndThenReleasesThem)
{
    using Clock = std::chrono::steady_clock;
    constexpr std::chrono::milliseconds kKept{100};
    if (isZeroCopy())
        GTEST_SKIP() << "no command copies";
    EglTestContext::releaseCurrent();
    for (const bool hasEvent : {false, true}) {
        SCOPED_TRACE(hasEvent);
        const Queue queue(fContext, fDevice, CL_QUEUE_OUT_OF_ORDER_EXEC_MODE_ENABLE);
        const auto references = [&queue] {
            return infoOf<cl_uint>(clGetCommandQueueInfo, queue, CL_QUEUE_REFERENCE_COUNT);
        };
        const Memory memory = share(fBuffer);
        const Event gate = makeUserEvent();
        Event event;
        EXPECT_EQ(queue.acquire(memory, {gate}, hasEvent ? &event : nullptr), CL_SUCCESS);
        clFlush(queue); // some runtimes keep the events of commands that are not flushed
        const Clock::time_point failure = Clock::now();
        clSetUserEventStatus(gate, -5);
        std::this_thread::sleep_for(hasEvent ? 3 * kKept : kKept / 3);
        const cl_uint kept = references();
        if (hasEvent || Clock::now() < failure + kKept) {
            EXPECT_GT(kept, hasEvent ? 2U : 1U);
        }
        event = nullptr;
        EXPECT_TRUE(becomesTrue([&] { return references() == 1; }));
    }
}

// Each row has another object that keeps the context alive. A runtime before OpenCL 3.0 does not
// report the end of a context, which then shares as long as a shared buffer of it exists.
TEST_F(LifetimeTest, ReleasedContextSharesWhileAnyObjectRefersToIt)
{
    cl_version version = 0;
    const bool isOld = clGetPlatformInfo(fPlatform, CL_PLATFORM_NUMERIC_VERSION, sizeof version,
                                         &version, nullptr) != CL_SUCCESS;
    const char* source = "kernel void nothing() {}";
    const std::ptrdiff_t threads = threadCount();
    for (int kind = isOld ? 4 : 0; kind < 5; ++kind) {
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
    EXPECT_TRUE(becomesTrue([&] { return threadCount() <= threads; })) << "a context is kept";
}

TEST_F(LifetimeTest, ReleasedBufferCompletesItsPendingCommands)
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

TEST_F(LifetimeTest, ReleasedMemoryObjectFreesTheStorage)
{
    const auto residentBytes = [] {
        long total = 0;
        long resident = 0;
        std::ifstream("/proc/self/statm") >> total >> resident;
        EXPECT_GT(resident, 0);
        return resident * sysconf(_SC_PAGESIZE);
    };
    // Large enough that the C library returns each one to the system at once.
    constexpr std::size_t kLarge = std::size_t{40} << 20;
    const Numbers content(kLarge / sizeof(cl_int), 1);
    const auto rounds = [&](int count) {
        for (int i = 0; i < count; ++i) {
            const GLuint buffer = makeGlBuffer(content);
            const Memory memory = share(buffer);
            glDeleteBuffers(1, &buffer);
        }
        // The layer's thread frees the storage. This call waits for it, since its tasks run in
        // order.
        share(makeGlBuffer(Numbers(1, 1)));
    };
    rounds(5); // fills the caches of the allocators
    const long before = residentBytes();
    rounds(15);
    EXPECT_LT(residentBytes() - before, static_cast<long>(5 * kLarge));
}

TEST_F(LifetimeTest, SharingContinuesAfterTheGlContextIsDestroyed)
{
    const EglTestContext second(fGl.get());
    ASSERT_TRUE(second.valid());
    fGl->destroy();
    fQueue.rewrite(fMemory, from(1), from(11));
    second.makeCurrent();
    EXPECT_EQ(readGl(fBuffer, fCount), from(11));
    EglTestContext::releaseCurrent();
}

} // namespace
