// The fixture of the layer's tests: an OpenGL context, current on the test's thread, an OpenCL
// context and an in-order queue that share with it, and a shared buffer. The tests run with several
// settings of the layer's environment variables, which the fixture reports.
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

// Returns `count` consecutive numbers, starting at `first`.
[[nodiscard]] Numbers numbersFrom(cl_int first, std::size_t count);

// Owns a reference to an OpenCL object, and converts to its handle.
template <typename Handle, cl_int (*release)(Handle)>
class Owned {
public:
    Owned(Handle handle = nullptr) : fHandle(handle) {}
    ~Owned()
    {
        if (fHandle != nullptr)
            release(fHandle);
    }
    Owned(Owned&& other) noexcept : fHandle(std::exchange(other.fHandle, nullptr)) {}
    Owned& operator=(Owned other) noexcept
    {
        std::swap(fHandle, other.fHandle);
        return *this;
    }
    operator Handle() const { return fHandle; }

    // For calls that read a list of one handle, or store a new handle in an empty object.
    Handle* address() { return &fHandle; }

private:
    Handle fHandle;
};

using Context = Owned<cl_context, clReleaseContext>;
using Event = Owned<cl_event, clReleaseEvent>;
using Memory = Owned<cl_mem, clReleaseMemObject>;

// An OpenCL queue. `event`, if not null, gets the command's event.
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

    // Fills the whole memory object with `value`, without waiting.
    void fill(cl_mem memory, cl_int value, const WaitList& waitList = {},
              Event* event = nullptr) const;

    // Blocking.
    [[nodiscard]] Numbers read(cl_mem memory, std::size_t count) const;
    void write(cl_mem memory, const Numbers& numbers) const;

    // Acquires, expects the contents `before`, writes `after`, releases and waits.
    void rewrite(cl_mem memory, const Numbers& before, const Numbers& after) const;

private:
    cl_int share(decltype(&clEnqueueAcquireGLObjects) call, cl_mem memory, const WaitList& waitList,
                 Event* event) const;

    Owned<cl_command_queue, clReleaseCommandQueue> fQueue;
};

// Returns one value of the information query `get`.
template <typename Value, typename Get, typename Handle>
Value infoOf(Get get, const Handle& handle, cl_uint name)
{
    Value value{};
    EXPECT_EQ(get(handle, name, sizeof(Value), static_cast<void*>(&value), nullptr), CL_SUCCESS);
    return value;
}

[[nodiscard]] cl_int statusOf(const Event& event);

[[nodiscard]] std::ptrdiff_t threadCount();

// Waits some seconds for other threads to make `condition` true; returns whether it became true.
[[nodiscard]] bool becomesTrue(const std::function<bool()>& condition);

// Runs `work` on a new thread, which has no current OpenGL context, and waits for it.
void onOtherThread(const std::function<void()>& work);

// Binds a new framebuffer of side x side pixels without attachments, and a new vertex array.
void bindEmptyFramebuffer(GLsizei side);

class SharingTest : public testing::Test {
protected:
    // The buffer has the numbers from 1 to `count`.
    explicit SharingTest(std::size_t count = 5000) : fCount(count) {}

    void SetUp() override;

    // Makes an OpenGL context current and sets `fGlEntries`.
    virtual void openGl();

    // Returns whether an environment variable of the layer, if it is set, is not 0.
    static bool isOn(const char* variable, bool byDefault = true);
    static bool offersGlEvent() { return isOn("GLSHARE_GL_EVENT"); }
    static bool isZeroCopy() { return isOn("GLSHARE_ZERO_COPY", false); }

    static std::string extensionsOf(cl_platform_id platform);

    // Return a property list for the platform with `entries`, by default those of the OpenGL
    // context.
    [[nodiscard]] Properties properties(const Properties& entries) const;
    [[nodiscard]] Properties properties() const { return properties(fGlEntries); }
    [[nodiscard]] Context makeContext(const Properties& list) const;
    [[nodiscard]] Context makeContext() const { return makeContext(properties()); }
    [[nodiscard]] Event makeUserEvent() const { return clCreateUserEvent(fContext, nullptr); }

    // Create a bound OpenGL buffer with these numbers, and a memory object from a buffer.
    static GLuint makeGlBuffer(const Numbers& numbers);
    static Memory share(cl_context context, GLuint buffer, cl_mem_flags flags = CL_MEM_READ_WRITE);
    Memory share(GLuint buffer) const { return share(fContext, buffer); }

    // Bind the buffer, and replace its storage or its contents.
    static void reallocate(GLuint buffer, const Numbers& numbers);
    static void overwrite(GLuint buffer, const Numbers& numbers);
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
