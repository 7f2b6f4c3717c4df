// The layer without memory or threads: each call returns an error, changes nothing, and succeeds
// when repeated. The layer's allocations call this program's operator new. Only they fail, not
// those of OpenCL and OpenGL.
//
// First, since it includes the newest OpenCL headers.
#include "core/api/OpenCl.h"

#include "ReplacedOperators.h"
#include "SharingTest.h"

#include <algorithm>
#include <array>
#include <atomic>
#include <chrono>
#include <functional>
#include <span>
#include <string_view>
#include <thread>
#include <utility>

#include <dlfcn.h>
#include <execinfo.h>
#include <pthread.h>

namespace {

// The number of the layer's allocation that fails, counted down on all threads; none if not
// positive.
std::atomic<int> allocationsLeft{0};

// Returns whether the layer is the innermost caller that is not this program, the standard library
// or a sanitizer.
bool isCalledByLayer()
{
    std::array<void*, 24> frames{};
    const auto count = static_cast<std::size_t>(backtrace(frames.data(), frames.size()));
    Dl_info own{};
    Dl_info caller{};
    dladdr(&allocationsLeft, &own);
    for (const void* frame : std::span(frames).first(count)) {
        if (dladdr(frame, &caller) == 0)
            return false;
        const std::string_view file = caller.dli_fname;
        const auto isIn = [&](const char* name) {
            return file.find(name) != std::string_view::npos;
        };
        if (caller.dli_fbase != own.dli_fbase && !isIn("libstdc++") && !isIn("san.so"))
            return isIn("libglshare");
    }
    return false;
}

} // namespace

bool nextAllocationFails()
{
    return allocationsLeft > 0 && isCalledByLayer() && --allocationsLeft == 0;
}

namespace {

// Much longer than other threads take to release the objects of a call.
constexpr std::chrono::milliseconds kSettled{20};

// The reference counts of a context, a queue and a memory object, and the number of threads.
using InUse = std::array<std::ptrdiff_t, 4>;

class AllocationTest : public SharingTest {
protected:
    // Makes one call with a failing allocation, waits for its commands, checks and releases its
    // results, and returns its status.
    using Call = std::function<cl_int()>;

    void TearDown() override { endFailing(); }

    // Enclose the call itself.
    void beginFailing() const { allocationsLeft = fFailing; }
    cl_int endFailing(cl_int status = CL_SUCCESS)
    {
        fHasFailed = fFailing > 0 && allocationsLeft <= 0;
        allocationsLeft = 0;
        return status;
    }

    [[nodiscard]] InUse inUse() const
    {
        return {infoOf<cl_uint>(clGetContextInfo, fContext, CL_CONTEXT_REFERENCE_COUNT),
                infoOf<cl_uint>(clGetCommandQueueInfo, fQueue, CL_QUEUE_REFERENCE_COUNT),
                infoOf<cl_uint>(clGetMemObjectInfo, fMemory, CL_MEM_REFERENCE_COUNT),
                threadCount()};
    }

    // Other threads may still hold references.
    void expectNoLeaks(const InUse& before) const
    {
        const auto isAtMostBefore = [&] {
            return std::ranges::equal(inUse(), before, std::less_equal());
        };
        EXPECT_TRUE(becomesTrue(isAtMostBefore)) << testing::PrintToString(inUse());
    }

    // Repeats a call, and fails its first allocation, its second, and so on until none fails. If
    // `maySucceed`, allocations of callbacks may fail, which the call does not report.
    void failEachAllocation(const char* name, const Call& call, cl_int expected = CL_SUCCESS,
                            bool maySucceed = false, int fewest = 1)
    {
        SCOPED_TRACE(name);
        EXPECT_EQ(call(), expected);
        std::this_thread::sleep_for(kSettled);
        const InUse before = inUse();
        for (fFailing = 1;; ++fFailing) {
            const cl_int status = call();
            if (!maySucceed || status != expected) {
                EXPECT_EQ(status, fHasFailed ? CL_OUT_OF_HOST_MEMORY : expected) << fFailing;
            }
            expectNoLeaks(before);
            if (!fHasFailed)
                break;
        }
        EXPECT_GT(std::exchange(fFailing, 0), fewest) << "too few allocations";
    }

    // An information query that returns at most a Value.
    template <typename Value, typename Get, typename Handle>
    Call query(Get get, Handle handle, cl_uint name)
    {
        return [=, this] {
            Value value{};
            beginFailing();
            return endFailing(get(handle, name, sizeof value, static_cast<void*>(&value), nullptr));
        };
    }

    // A call that creates an object and sets an error.
    template <typename Object, typename Make>
    Call creation(Make make)
    {
        return [=, this] {
            cl_int error = CL_INVALID_VALUE;
            beginFailing();
            const Object object = make(&error);
            endFailing();
            EXPECT_EQ(object != nullptr, error == CL_SUCCESS);
            return error;
        };
    }

    int fFailing = 0; // the number of the allocation that fails, from 1; 0: none
    bool fHasFailed = false;
};

TEST_F(AllocationTest, QueriesWithoutMemoryReturnOutOfHostMemory)
{
    using Text = std::array<char, 16384>;
    const Memory plain = clCreateBuffer(fContext, CL_MEM_READ_WRITE, 64, nullptr, nullptr);
    const Properties list = properties();
    for (const cl_uint name :
         {cl_uint{CL_DEVICE_EXTENSIONS}, cl_uint{CL_DEVICE_EXTENSIONS_WITH_VERSION}})
        failEachAllocation("device", query<Text>(clGetDeviceInfo, fDevice, name));
    for (const cl_uint name :
         {cl_uint{CL_PLATFORM_EXTENSIONS}, cl_uint{CL_PLATFORM_EXTENSIONS_WITH_VERSION}})
        failEachAllocation("platform", query<Text>(clGetPlatformInfo, fPlatform, name));
    failEachAllocation("OpenGL context", query<cl_device_id>(clGetGLContextInfoKHR, list.data(),
                                                             CL_CURRENT_DEVICE_FOR_GL_CONTEXT_KHR));
    failEachAllocation("texture",
                       query<cl_int>(clGetGLTextureInfo, cl_mem(plain), CL_GL_TEXTURE_TARGET),
                       CL_INVALID_GL_OBJECT);
}

TEST_F(AllocationTest, CreationsWithoutMemoryReturnOutOfHostMemory)
{
    const Context plain = makeContext({0});
    const Properties list = properties();
    failEachAllocation("context", creation<Context>([&](cl_int* error) {
                           return clCreateContext(list.data(), 1, &fDevice, nullptr, nullptr,
                                                  error);
                       }));
    failEachAllocation("context from type", creation<Context>([&](cl_int* error) {
                           return clCreateContextFromType(list.data(), CL_DEVICE_TYPE_ALL, nullptr,
                                                          nullptr, error);
                       }));
    failEachAllocation("buffer", creation<Memory>([&](cl_int* error) {
                           return clCreateFromGLBuffer(fContext, CL_MEM_READ_WRITE, fBuffer, error);
                       }));
    failEachAllocation("renderbuffer", creation<Memory>([&](cl_int* error) {
                           return clCreateFromGLRenderbuffer(plain, CL_MEM_READ_WRITE, 1, error);
                       }),
                       CL_INVALID_CONTEXT);
}

// A context with two buffers, and commands on both.
struct Pair {
    Context context;
    Queue queue;
    std::array<Memory, 2> owners;

    [[nodiscard]] cl_int enqueue(bool isRelease, cl_event* event = nullptr) const
    {
        const std::array<cl_mem, 2> memory{owners[0], owners[1]};
        const auto call = isRelease ? clEnqueueReleaseGLObjects : clEnqueueAcquireGLObjects;
        const cl_int error = call(queue, 2, memory.data(), 0, nullptr, event);
        return error != CL_SUCCESS || event == nullptr ? error : clWaitForEvents(1, event);
    }
};

// The first acquire or release of a context, which allocates. A failed one can be repeated.
TEST_F(AllocationTest, CommandsWithoutMemoryReturnOutOfHostMemory)
{
    const GLuint other = makeGlBuffer(from(1));
    cl_int value = 1;
    for (const bool isRelease : {false, true}) {
        if (isRelease && isZeroCopy())
            break; // allocates nothing
        const auto call = [&] {
            Pair pair{makeContext(), {}, {}};
            pair.queue = Queue(pair.context, fDevice);
            pair.owners = {share(pair.context, fBuffer), share(pair.context, other)};
            if (isRelease) {
                EXPECT_EQ(pair.enqueue(false), CL_SUCCESS);
            }
            Event event;
            beginFailing();
            const cl_int error = endFailing(pair.enqueue(isRelease, event.address()));
            EXPECT_EQ(event != nullptr, error == CL_SUCCESS);
            if (isRelease != (error == CL_SUCCESS)) { // acquired
                EXPECT_EQ(pair.queue.read(pair.owners[0], fCount), from(value));
                pair.queue.write(pair.owners[0], from(++value));
                EXPECT_EQ(pair.enqueue(true), CL_SUCCESS);
            }
            clFinish(pair.queue);
            EXPECT_EQ(readGl(fBuffer, fCount), from(value));
            return error;
        };
        // A release reuses the memory of the acquire if the layer's thread has returned it by then.
        failEachAllocation(isRelease ? "release" : "acquire", call, CL_SUCCESS, true,
                           isRelease ? 0 : 1);
    }
}

// The layer reuses the memory of earlier commands. The first commands are pending at the same time,
// since the layer's thread may return their memory long after a command has ended.
TEST_F(AllocationTest, CommandsAllocateNothingAfterTheFirst)
{
    constexpr int kMany = 1000000;
    const Memory second = share(makeGlBuffer(from(1)));
    EglTestContext::releaseCurrent(); // else each release would wait
    const Event gate = makeUserEvent();
    const auto runFrame = [&] {
        for (cl_mem memory : {cl_mem(fMemory), cl_mem(second)}) {
            Event acquired;
            Event released;
            EXPECT_EQ(fQueue.acquire(memory, {gate}, &acquired), CL_SUCCESS);
            EXPECT_EQ(fQueue.release(memory, {acquired}, &released), CL_SUCCESS);
        }
    };
    for (int frame = 0; frame < 10; ++frame)
        runFrame();
    clSetUserEventStatus(gate, CL_COMPLETE);
    clFinish(fQueue);
    std::this_thread::sleep_for(kSettled);
    fGl->makeCurrent();
    allocationsLeft = kMany;
    for (int frame = 0; frame < 10; ++frame) {
        runFrame();
        clFinish(fQueue);
    }
    EXPECT_EQ(allocationsLeft, kMany);
}

TEST_F(AllocationTest, SyncEventsWithoutMemoryReturnOutOfHostMemory)
{
    const auto create = reinterpret_cast<decltype(&clCreateEventFromGLsyncKHR)>(
        clGetExtensionFunctionAddressForPlatform(fPlatform, "clCreateEventFromGLsyncKHR"));
    if (create == nullptr)
        GTEST_SKIP() << "disabled by GLSHARE_GL_EVENT";
    failEachAllocation("event", [&] {
        GLsync sync = glFenceSync(GL_SYNC_GPU_COMMANDS_COMPLETE, 0);
        cl_int error = CL_INVALID_VALUE;
        beginFailing();
        Event event = create(fContext, reinterpret_cast<cl_GLsync>(sync), &error);
        endFailing(error == CL_SUCCESS ? clWaitForEvents(1, event.address()) : error);
        glDeleteSync(sync);
        EXPECT_EQ(event != nullptr, error == CL_SUCCESS);
        return error;
    });
}

// No stack of 2^48 bytes fits into the address space.
TEST_F(AllocationTest, CreateContextWithoutThreadReturnsOutOfHostMemory)
{
    const Properties list = properties();
    pthread_attr_t normal;
    pthread_attr_t impossible;
    ASSERT_EQ(pthread_getattr_default_np(&normal), 0);
    ASSERT_EQ(pthread_getattr_default_np(&impossible), 0);
    ASSERT_EQ(pthread_attr_setstacksize(&impossible, std::size_t{1} << 48), 0);
    ASSERT_EQ(pthread_setattr_default_np(&impossible), 0);
    cl_int error = CL_SUCCESS;
    EXPECT_EQ(clCreateContext(list.data(), 1, &fDevice, nullptr, nullptr, &error), nullptr);
    EXPECT_EQ(error, CL_OUT_OF_HOST_MEMORY);
    pthread_setattr_default_np(&normal);
    share(makeContext(), fBuffer);
}

} // namespace
