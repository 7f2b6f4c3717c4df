// What OpenCL and OpenGL see of each other's writes.
#include "SharingTest.h"

#include <CL/cl.h>

#include <array>
#include <atomic>
#include <thread>

namespace {

constexpr std::size_t kCount = 5000;
constexpr std::size_t kBytes = kCount * sizeof(cl_int);

class BufferContentsTest : public SharingTest {
protected:
    // Acquires, checks what OpenCL sees, writes something else, releases, checks what OpenGL sees.
    void roundTrip(GLuint buffer, cl_mem memory, const Numbers& before, const Numbers& after)
    {
        ASSERT_EQ(acquire(memory), CL_SUCCESS);
        EXPECT_EQ(readCl(memory, before.size()), before);
        writeCl(memory, after);
        ASSERT_EQ(release(memory), CL_SUCCESS);
        clFinish(queue_);
        EXPECT_EQ(readGl(buffer, after.size()), after);
    }
};

TEST_F(BufferContentsTest, WritesCrossInBothDirections)
{
    const GLuint buffer = makeGlBuffer(numbersFrom(1, kCount));
    cl_mem memory = share(buffer);
    roundTrip(buffer, memory, numbersFrom(1, kCount), numbersFrom(100, kCount));

    const Numbers drawn = numbersFrom(-7, kCount);
    glBufferSubData(GL_ARRAY_BUFFER, 0, kBytes, drawn.data());
    glFinish();
    roundTrip(buffer, memory, drawn, numbersFrom(3, kCount));
    clReleaseMemObject(memory);
}

TEST_F(BufferContentsTest, BytesAreCopiedOnlyWithoutZeroCopy)
{
    const GLuint buffer = makeGlBuffer(numbersFrom(1, kCount));
    cl_mem memory = share(buffer);
    const glshare_counters before = counters();
    roundTrip(buffer, memory, numbersFrom(1, kCount), numbersFrom(2, kCount));
    const glshare_counters after = counters();
    EXPECT_EQ(after.bytes_copied - before.bytes_copied, isZeroCopy() ? 0 : 2 * kBytes);
    EXPECT_EQ(after.acquired_in_place - before.acquired_in_place, isZeroCopy() ? 1 : 0);
    EXPECT_EQ(after.acquired_by_copy - before.acquired_by_copy, isZeroCopy() ? 0 : 1);
    EXPECT_EQ(after.released_by_copy - before.released_by_copy, isZeroCopy() ? 0 : 1);
    EXPECT_EQ(after.failed_copies, before.failed_copies);
    clReleaseMemObject(memory);
}

// The storage moves away from under the memory object, which stays the same.
TEST_F(BufferContentsTest, ReallocatedBuffersKeepSharing)
{
    const GLuint buffer = makeGlBuffer(numbersFrom(1, kCount));
    cl_mem memory = share(buffer);
    roundTrip(buffer, memory, numbersFrom(1, kCount), numbersFrom(2, kCount));

    for (const std::size_t factor : {3U, 200U, 1U}) {
        SCOPED_TRACE(factor);
        const Numbers larger = numbersFrom(static_cast<cl_int>(factor), kCount * factor);
        glBindBuffer(GL_ARRAY_BUFFER, buffer);
        glBufferData(GL_ARRAY_BUFFER, static_cast<GLsizeiptr>(kBytes * factor), larger.data(),
                     GL_STATIC_DRAW);
        glFinish();
        const Numbers seen(larger.begin(), larger.begin() + kCount);
        roundTrip(buffer, memory, seen, numbersFrom(77, kCount));
    }
    clReleaseMemObject(memory);
}

// OpenCL still uses the old storage when OpenGL replaces it.
TEST_F(BufferContentsTest, ReallocationWhileAcquiredIsHarmless)
{
    const GLuint buffer = makeGlBuffer(numbersFrom(1, kCount));
    cl_mem memory = share(buffer);
    ASSERT_EQ(acquire(memory), CL_SUCCESS);
    const Numbers larger = numbersFrom(9, kCount * 50);
    glBindBuffer(GL_ARRAY_BUFFER, buffer);
    glBufferData(GL_ARRAY_BUFFER, static_cast<GLsizeiptr>(kBytes * 50), larger.data(),
                 GL_STATIC_DRAW);
    writeCl(memory, numbersFrom(5, kCount));
    EXPECT_EQ(readCl(memory, kCount), numbersFrom(5, kCount));
    EXPECT_EQ(release(memory), CL_SUCCESS);
    clFinish(queue_);

    const Numbers latest = numbersFrom(21, kCount);
    glBufferSubData(GL_ARRAY_BUFFER, 0, kBytes, latest.data());
    glFinish();
    roundTrip(buffer, memory, latest, numbersFrom(31, kCount));
    clReleaseMemObject(memory);
}

TEST_F(BufferContentsTest, BuffersThatTheApplicationKeepsMappedAreShared)
{
    GLuint buffer = 0;
    glGenBuffers(1, &buffer);
    glBindBuffer(GL_ARRAY_BUFFER, buffer);
    constexpr GLbitfield access = GL_MAP_WRITE_BIT | GL_MAP_PERSISTENT_BIT | GL_MAP_COHERENT_BIT;
    const Numbers first = numbersFrom(1, kCount);
    glBufferStorage(GL_ARRAY_BUFFER, kBytes, first.data(), access);
    ASSERT_NE(glMapBufferRange(GL_ARRAY_BUFFER, 0, kBytes, access), nullptr);
    cl_mem memory = share(buffer);
    roundTrip(buffer, memory, first, numbersFrom(50, kCount));
    clReleaseMemObject(memory);
}

TEST_F(BufferContentsTest, ImmutableBuffersWithoutMapAccessAreShared)
{
    GLuint buffer = 0;
    glGenBuffers(1, &buffer);
    glBindBuffer(GL_ARRAY_BUFFER, buffer);
    const Numbers first = numbersFrom(1, kCount);
    glBufferStorage(GL_ARRAY_BUFFER, kBytes, first.data(), 0);
    cl_mem memory = share(buffer);
    roundTrip(buffer, memory, first, numbersFrom(50, kCount));
    clReleaseMemObject(memory);
}

// One list with buffers of every kind: in place, moved, and never in place.
TEST_F(BufferContentsTest, OneCommandCarriesManyBuffers)
{
    constexpr std::size_t kBuffers = 64;
    std::vector<GLuint> buffers;
    std::vector<cl_mem> memory;
    for (std::size_t i = 0; i < kBuffers; ++i) {
        buffers.push_back(makeGlBuffer(numbersFrom(static_cast<cl_int>(i), kCount)));
        memory.push_back(share(buffers.back()));
    }
    for (std::size_t i = 0; i < kBuffers; i += 3) {
        const Numbers moved = numbersFrom(static_cast<cl_int>(i), kCount * 2);
        glBindBuffer(GL_ARRAY_BUFFER, buffers[i]);
        glBufferData(GL_ARRAY_BUFFER, kBytes * 2, moved.data(), GL_STREAM_DRAW);
    }
    glFinish();
    ASSERT_EQ(clEnqueueAcquireGLObjects(queue_, kBuffers, memory.data(), 0, nullptr, nullptr),
              CL_SUCCESS);
    for (std::size_t i = 0; i < kBuffers; ++i) {
        EXPECT_EQ(readCl(memory[i], kCount), numbersFrom(static_cast<cl_int>(i), kCount)) << i;
        writeCl(memory[i], numbersFrom(static_cast<cl_int>(1000 + i), kCount));
    }
    ASSERT_EQ(clEnqueueReleaseGLObjects(queue_, kBuffers, memory.data(), 0, nullptr, nullptr),
              CL_SUCCESS);
    clFinish(queue_);
    for (std::size_t i = 0; i < kBuffers; ++i) {
        EXPECT_EQ(readGl(buffers[i], kCount), numbersFrom(static_cast<cl_int>(1000 + i), kCount))
            << i;
        clReleaseMemObject(memory[i]);
    }
}

// Threads without an OpenGL context, each with a queue and a buffer of its own.
TEST_F(BufferContentsTest, ThreadsShareAtTheSameTime)
{
    constexpr std::size_t kThreads = 4;
    constexpr cl_int kRounds = 50;
    std::array<GLuint, kThreads> buffers{};
    std::array<cl_mem, kThreads> memory{};
    for (std::size_t i = 0; i < kThreads; ++i) {
        buffers.at(i) = makeGlBuffer(Numbers(kCount, 0));
        memory.at(i) = share(buffers.at(i));
    }
    glFinish();
    std::atomic<int> failures{0};
    const auto work = [&](std::size_t i) {
        cl_command_queue queue = clCreateCommandQueue(context_, device_, 0, nullptr);
        for (cl_int round = 0; round < kRounds; ++round) {
            const cl_int value = round + static_cast<cl_int>(i);
            if (clEnqueueAcquireGLObjects(queue, 1, &memory.at(i), 0, nullptr, nullptr) !=
                    CL_SUCCESS ||
                clEnqueueFillBuffer(queue, memory.at(i), &value, sizeof value, 0, kBytes, 0,
                                    nullptr, nullptr) != CL_SUCCESS ||
                clEnqueueReleaseGLObjects(queue, 1, &memory.at(i), 0, nullptr, nullptr) !=
                    CL_SUCCESS)
                ++failures;
        }
        clFinish(queue);
        clReleaseCommandQueue(queue);
    };
    std::vector<std::thread> threads;
    for (std::size_t i = 0; i < kThreads; ++i)
        threads.emplace_back(work, i);
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_EQ(failures, 0);
    for (std::size_t i = 0; i < kThreads; ++i) {
        EXPECT_EQ(readGl(buffers.at(i), kCount),
                  Numbers(kCount, kRounds - 1 + static_cast<cl_int>(i)));
        clReleaseMemObject(memory.at(i));
    }
}

} // namespace
