// What is kept, and for how long, when things go in any order.
#include "SharingTest.h"

#include <dirent.h>
#include <unistd.h>

#include <cstdio>

namespace {

constexpr std::size_t kCount = 100000;

std::size_t threadsOfProcess()
{
    std::size_t count = 0;
    DIR* tasks = opendir("/proc/self/task");
    while (const dirent* task = readdir(tasks))
        count += task->d_name[0] != '.' ? 1 : 0;
    closedir(tasks);
    return count;
}

class LifetimeTest : public SharingTest {
protected:
    void acquireWriteRelease(cl_mem memory, cl_int first)
    {
        EXPECT_EQ(acquire(memory), CL_SUCCESS);
        writeCl(memory, numbersFrom(first, kCount));
        EXPECT_EQ(release(memory), CL_SUCCESS);
        clFinish(queue_);
    }
};

TEST_F(LifetimeTest, ContextsTakeTheirWorkerAlong)
{
    const std::size_t before = threadsOfProcess();
    for (int i = 0; i < 20; ++i) {
        cl_int error = CL_SUCCESS;
        cl_context context =
            clCreateContext(properties(*gl_).data(), 1, &device_, nullptr, nullptr, &error);
        ASSERT_EQ(error, CL_SUCCESS);
        clRetainContext(context);
        clReleaseContext(context);
        const GLuint buffer = makeGlBuffer(numbersFrom(0, 10));
        cl_mem memory = clCreateFromGLBuffer(context, CL_MEM_READ_WRITE, buffer, &error);
        EXPECT_EQ(error, CL_SUCCESS);
        clReleaseMemObject(memory);
        glDeleteBuffers(1, &buffer);
        clReleaseContext(context);
    }
    // Threads of what was there before may have ended in the meantime.
    EXPECT_LE(threadsOfProcess(), before);
}

// The application's last reference to the context is not the last one.
TEST_F(LifetimeTest, ObjectsOutliveTheReferenceToTheirContext)
{
    const GLuint buffer = makeGlBuffer(numbersFrom(0, kCount));
    cl_mem memory = share(buffer);
    clReleaseContext(context_);
    context_ = nullptr;
    acquireWriteRelease(memory, 4);
    EXPECT_EQ(readGl(buffer, kCount), numbersFrom(4, kCount));
    clReleaseMemObject(memory);
}

TEST_F(LifetimeTest, ReleasedObjectsFinishTheirCommandsFirst)
{
    const GLuint buffer = makeGlBuffer(numbersFrom(0, kCount));
    cl_mem memory = share(buffer);
    cl_event gate = clCreateUserEvent(context_, nullptr);
    onOtherThread([&] {
        const cl_int value = 9;
        EXPECT_EQ(acquire(memory, {gate}), CL_SUCCESS);
        EXPECT_EQ(clEnqueueFillBuffer(queue_, memory, &value, sizeof value, 0,
                                      kCount * sizeof(cl_int), 0, nullptr, nullptr),
                  CL_SUCCESS);
        EXPECT_EQ(release(memory), CL_SUCCESS);
        clReleaseMemObject(memory);
        clFlush(queue_);
    });
    clSetUserEventStatus(gate, CL_COMPLETE);
    clFinish(queue_);
    clReleaseEvent(gate);
    EXPECT_EQ(readGl(buffer, kCount), Numbers(kCount, 9));
}

// Storage is held as long as the object that lies over it, and no longer.
TEST_F(LifetimeTest, StorageGoesWithTheObject)
{
    const auto residentPages = [] {
        long total = 0;
        long resident = 0;
        FILE* file = fopen("/proc/self/statm", "r");
        EXPECT_EQ(fscanf(file, "%ld %ld", &total, &resident), 2);
        fclose(file);
        return resident;
    };
    // Large enough that the C library gives each one back to the system at once.
    constexpr std::size_t kLarge = std::size_t{40} << 20;
    const Numbers content(kLarge / sizeof(cl_int), 1);
    const auto once = [&] {
        const GLuint buffer = makeGlBuffer(content);
        cl_mem memory = share(buffer);
        glDeleteBuffers(1, &buffer);
        clReleaseMemObject(memory);
    };
    // Storage is given back on another thread; what is asked of it afterwards is answered later.
    const auto settle = [&] {
        cl_mem memory = share(makeGlBuffer(Numbers(1, 1)));
        clReleaseMemObject(memory);
    };
    const auto rounds = [&](int count) {
        for (int i = 0; i < count; ++i)
            once();
        settle();
    };
    rounds(5); // until the allocators have what they keep
    const long before = residentPages();
    rounds(15);
    EXPECT_LT((residentPages() - before) * sysconf(_SC_PAGESIZE), static_cast<long>(5 * kLarge));
}

TEST_F(LifetimeTest, SharingGoesOnWithoutTheApplicationsGlContext)
{
    const EglTestContext second(gl_.get());
    ASSERT_TRUE(second.valid());
    const GLuint buffer = makeGlBuffer(numbersFrom(0, kCount));
    cl_mem memory = share(buffer);
    gl_->destroy();
    acquireWriteRelease(memory, 11);
    second.makeCurrent();
    EXPECT_EQ(readGl(buffer, kCount), numbersFrom(11, kCount));
    EglTestContext::releaseCurrent();
    clReleaseMemObject(memory);
}

TEST_F(LifetimeTest, AContextCurrentElsewhereCanBeSharedWith)
{
    const GLuint buffer = makeGlBuffer(numbersFrom(0, kCount)); // current on this thread
    glFinish();
    onOtherThread([&] {
        cl_int error = CL_SUCCESS;
        cl_context context =
            clCreateContext(properties(*gl_).data(), 1, &device_, nullptr, nullptr, &error);
        ASSERT_EQ(error, CL_SUCCESS);
        cl_mem memory = clCreateFromGLBuffer(context, CL_MEM_READ_WRITE, buffer, &error);
        EXPECT_EQ(error, CL_SUCCESS);
        clReleaseMemObject(memory);
        clReleaseContext(context);
    });
}

} // namespace
