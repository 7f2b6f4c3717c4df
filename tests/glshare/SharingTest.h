// What the tests of the layer share: an OpenGL context, current on the test's thread, an OpenCL
// context and an in-order queue that share with it, and a buffer of both. The tests run under each
// setting of the layer's switches and ask here which one it is.
#pragma once

#define GL_GLEXT_PROTOTYPES 1

#include "EglTestContext.h"

#include <CL/cl.h>
#include <CL/cl_gl.h>
#include <GL/gl.h>
#include <GL/glext.h>
#include <gtest/gtest.h>

#include <cstddef>
#include <functional>
#include <memory>
#include <string>
#include <utility>
#include <vector>

using Numbers = std::vector<cl_int>;
using Properties = std::vector<cl_context_properties>;
using WaitList = std::vector<cl_event>;

// `count` numbers from `first` on.
Numbers numbersFrom(cl_int first, std::size_t count);

// Owns a reference to an OpenCL object, and stands for it in calls.
template <typename Handle, cl_int (*giveBack)(Handle)>
class Owned {
public:
    Owned(Handle handle = nullptr) : fHandle(handle) {}
    ~Owned()
    {
        if (fHandle != nullptr)
            giveBack(fHandle);
    }
    Owned(Owned&& other) noexcept : fHandle(std::exchange(other.fHandle, nullptr)) {}
    Owned& operator=(Owned other) noexcept
    {
        std::swap(fHandle, other.fHandle);
        return *this;
    }
    operator Handle() const { return fHandle; }

    // Where calls read the handle, or put a new one if there is none yet.
    Handle* place() { return &fHandle; }

private:
    Handle fHandle;
};

using Context = Owned<cl_context, clReleaseContext>;
using Event = Owned<cl_event, clReleaseEvent>;
using Memory = Owned<cl_mem, clReleaseMemObject>;

// An OpenCL queue with the calls that the tests make. `event` gets the command's.
class Queue {
public:
    Queue() = default;
    Queue(cl_context context, cl_device_id device, cl_command_queue_properties kind = 0);
    operator cl_command_queue() const { return fQueue; }

    cl_int acquire(cl_mem memory, const WaitList& waitList = {}, Event* event = nullptr) const
    {
        return share(clEnqueueAcquireGLObjects, memory, waitList, event);
    }
    cl_int release(cl_mem memory, const WaitList& waitList = {}, Event* event = nullptr) const
    {
        return share(clEnqueueReleaseGLObjects, memory, waitList, event);
    }

    // Writes `value` everywhere, without waiting.
    void fill(cl_mem memory, cl_int value, const WaitList& waitList = {},
              Event* event = nullptr) const;

    // Both wait.
    [[nodiscard]] Numbers read(cl_mem memory, std::size_t count) const;
    void write(cl_mem memory, const Numbers& numbers) const;

    // Acquires, checks what OpenCL sees, writes something else, releases and waits.
    void rewrite(cl_mem memory, const Numbers& before, const Numbers& after) const;

private:
    cl_int share(decltype(&clEnqueueAcquireGLObjects) call, cl_mem memory, const WaitList& waitList,
                 Event* event) const;

    Owned<cl_command_queue, clReleaseCommandQueue> fQueue;
};

// One fact about an OpenCL object, asked with `get`.
template <typename Value, typename Get, typename Handle>
Value infoOf(Get get, const Handle& handle, cl_uint name)
{
    Value value{};
    EXPECT_EQ(get(handle, name, sizeof(Value), static_cast<void*>(&value), nullptr), CL_SUCCESS);
    return value;
}

cl_int statusOf(const Event& event);

std::ptrdiff_t threadsOfProcess();

// Whether `isSo` holds within some seconds, which is the time that other threads may take.
bool isSoon(const std::function<bool()>& isSo);

// Runs on a thread of its own, which has no OpenGL context, and waits for it.
void onOtherThread(const std::function<void()>& work);

class SharingTest : public testing::Test {
protected:
    // The buffer has `count` numbers from 1 on.
    explicit SharingTest(std::size_t count = 5000) : fCount(count) {}

    void SetUp() override;

    // Makes an OpenGL context current and fills in `fGlEntries`.
    virtual void openGl();

    // Whether a switch of the layer is on, which is so unless it is 0.
    static bool isOn(const char* variable);
    static bool offersGlEvent() { return isOn("GLSHARE_GL_EVENT"); }
    static bool isZeroCopy();

    static std::string extensionsOf(cl_platform_id platform);

    // Properties of contexts on the platform, which share if nothing else is said.
    [[nodiscard]] Properties properties(const Properties& entries) const;
    [[nodiscard]] Properties properties() const { return properties(fGlEntries); }
    [[nodiscard]] Context makeContext(const Properties& list) const;
    [[nodiscard]] Context makeContext() const { return makeContext(properties()); }
    [[nodiscard]] Event makeUserEvent() const { return clCreateUserEvent(fContext, nullptr); }

    // A GL buffer with these numbers, bound, and an OpenCL object over one.
    static GLuint makeGlBuffer(const Numbers& numbers);
    static Memory share(cl_context context, GLuint buffer, cl_mem_flags flags = CL_MEM_READ_WRITE);
    Memory share(GLuint buffer) const { return share(fContext, buffer); }

    // Binds the buffer and gives it new storage, or new contents.
    static void refill(GLuint buffer, const Numbers& numbers);
    static void redraw(GLuint buffer, const Numbers& numbers);
    static Numbers readGl(GLuint buffer, std::size_t count);

    [[nodiscard]] Numbers from(cl_int first) const { return numbersFrom(first, fCount); }

    const std::size_t fCount;
    std::unique_ptr<EglTestContext> fGl;
    Properties fGlEntries;
    cl_platform_id fPlatform = nullptr;
    cl_device_id fDevice = nullptr;
    Context fContext;
    Queue fQueue;
    GLuint fBuffer = 0;
    Memory fMemory;
};
