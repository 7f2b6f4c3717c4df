// The contents that OpenCL and OpenGL read after each other's writes.
#include "SharingTest.h"

#include "glshare.h"

#include <array>
#include <functional>
#include <thread>

namespace {

class BufferContentsTest : public SharingTest {
protected:
    // Writes with OpenCL and expects OpenGL to read the result.
    void roundTrip(GLuint buffer, cl_mem memory, const Numbers& before, const Numbers& after)
    {
        ASSERT_NO_FATAL_FAILURE(fQueue.rewrite(memory, before, after));
        EXPECT_EQ(readGl(buffer, after.size()), after);
    }
};

TEST_F(BufferContentsTest, RoundTripCopiesBytesOnlyWithoutZeroCopy)
{
    const auto getCounters = reinterpret_cast<glshare_get_counters_fn>(
        clGetExtensionFunctionAddressForPlatform(fPlatform, GLSHARE_GET_COUNTERS_NAME));
    ASSERT_NE(getCounters, nullptr);
    glshare_counters before{};
    glshare_counters after{};
    getCounters(&before);
    roundTrip(fBuffer, fMemory, from(1), from(2));
    getCounters(&after);
    EXPECT_EQ(after.bytes_copied - before.bytes_copied,
              isZeroCopy() ? 0 : 2 * fCount * sizeof(cl_int));
    EXPECT_EQ(after.acquired_in_place - before.acquired_in_place, isZeroCopy() ? 1 : 0);
    EXPECT_EQ(after.acquired_by_copy - before.acquired_by_copy, isZeroCopy() ? 0 : 1);
    EXPECT_EQ(after.released_by_copy - before.released_by_copy, isZeroCopy() ? 0 : 1);
    EXPECT_EQ(after.failed_copies, before.failed_copies);
}

TEST_F(BufferContentsTest, AcquireAfterOverwriteOrReallocationReadsTheNewContents)
{
    overwrite(fBuffer, from(-7));
    glFinish();
    roundTrip(fBuffer, fMemory, from(-7), from(2));
    for (const cl_int factor : {3, 200, 1}) {
        SCOPED_TRACE(factor);
        reallocate(fBuffer, numbersFrom(factor, fCount * static_cast<std::size_t>(factor)));
        glFinish();
        roundTrip(fBuffer, fMemory, from(factor), from(77));
    }
}

TEST_F(BufferContentsTest, ReallocationWhileAcquiredKeepsTheContentsOfOpenCl)
{
    ASSERT_EQ(fQueue.acquire(fMemory), CL_SUCCESS);
    reallocate(fBuffer, numbersFrom(9, fCount * 50));
    fQueue.write(fMemory, from(5));
    EXPECT_EQ(fQueue.read(fMemory, fCount), from(5));
    EXPECT_EQ(fQueue.release(fMemory), CL_SUCCESS);
    clFinish(fQueue);

    overwrite(fBuffer, from(21));
    glFinish();
    roundTrip(fBuffer, fMemory, from(21), from(31));
}

// An acquire may use the context that is current on the calling thread.
TEST_F(BufferContentsTest, AcquireKeepsTheBindingAndErrorStateOfTheCaller)
{
    const GLuint bound = makeGlBuffer(from(4));
    const auto bytes = static_cast<GLsizeiptr>(fCount * sizeof(cl_int));
    const std::function<void()> changes[] = {
        [] {}, [this] { reallocate(fBuffer, numbersFrom(2, 2 * fCount)); },
        [] { glMapBuffer(GL_ARRAY_BUFFER, GL_READ_ONLY); },
        [bytes] {
            glUnmapBuffer(GL_ARRAY_BUFFER);
            glBufferStorage(GL_ARRAY_BUFFER, bytes, nullptr, 0);
        }};
    for (const auto& change : changes) {
        SCOPED_TRACE(&change - changes);
        glBindBuffer(GL_ARRAY_BUFFER, fBuffer);
        change();
        glBindBuffer(GL_COPY_READ_BUFFER, bound);
        EXPECT_EQ(fQueue.acquire(fMemory), CL_SUCCESS);
        EXPECT_EQ(fQueue.release(fMemory), CL_SUCCESS);
        clFinish(fQueue);
        GLint now = 0;
        glGetIntegerv(GL_COPY_READ_BUFFER_BINDING, &now);
        EXPECT_EQ(static_cast<GLuint>(now), bound);
        EXPECT_EQ(glGetError(), static_cast<GLenum>(GL_NO_ERROR));
    }
}

// Immutable storage that the application keeps mapped, and storage that cannot be mapped.
TEST_F(BufferContentsTest, RoundTripOfImmutableBufferTransfersContents)
{
    constexpr GLbitfield kMapped = GL_MAP_WRITE_BIT | GL_MAP_PERSISTENT_BIT | GL_MAP_COHERENT_BIT;
    for (const GLbitfield access : {kMapped, GLbitfield{0}}) {
        SCOPED_TRACE(access);
        GLuint buffer = 0;
        glGenBuffers(1, &buffer);
        glBindBuffer(GL_ARRAY_BUFFER, buffer);
        const auto size = static_cast<GLsizeiptr>(fCount * sizeof(cl_int));
        glBufferStorage(GL_ARRAY_BUFFER, size, from(1).data(), access);
        ASSERT_EQ(glMapBufferRange(GL_ARRAY_BUFFER, 0, size, access) != nullptr, access != 0);
        EXPECT_EQ(glGetError() != GL_NO_ERROR, access == 0);
        roundTrip(buffer, share(buffer), from(1), from(50));
    }
}

// OpenGL ES reads buffers only through a mapping.
TEST_F(BufferContentsTest, RoundTripOfOpenGlEsBufferTransfersContents)
{
    const EglTestContext es(nullptr, EGL_OPENGL_ES_API);
    ASSERT_TRUE(es.valid());
    es.makeCurrent();
    const GLuint buffer = makeGlBuffer(from(1));
    const Context context = makeContext(properties(es.entries()));
    const Queue queue(context, fDevice);
    queue.rewrite(share(context, buffer), from(1), from(50));
    const auto* numbers = static_cast<const cl_int*>(glMapBufferRange(
        GL_ARRAY_BUFFER, 0, static_cast<GLsizeiptr>(fCount * sizeof(cl_int)), GL_MAP_READ_BIT));
    ASSERT_NE(numbers, nullptr);
    EXPECT_EQ(Numbers(numbers, numbers + fCount), from(50));
    EXPECT_EQ(glGetError(), GLenum{GL_NO_ERROR});
    EglTestContext::releaseCurrent();
}

// With zero copy, one list has buffers used in place and copied ones.
TEST_F(BufferContentsTest, AcquireOfManyBuffersTransfersEach)
{
    constexpr cl_int kBuffers = 64;
    std::vector<GLuint> buffers;
    std::vector<Memory> owners;
    for (cl_int i = 0; i < kBuffers; ++i) {
        buffers.push_back(makeGlBuffer(from(i)));
        owners.push_back(share(buffers.back()));
        if (i % 3 == 0)
            reallocate(buffers.back(), numbersFrom(i, fCount * 2));
    }
    glFinish();
    const std::vector<cl_mem> memory(owners.begin(), owners.end());
    ASSERT_EQ(clEnqueueAcquireGLObjects(fQueue, kBuffers, memory.data(), 0, nullptr, nullptr),
              CL_SUCCESS);
    for (cl_int i = 0; cl_mem each : memory) {
        EXPECT_EQ(fQueue.read(each, fCount), from(i)) << i;
        fQueue.write(each, from(1000 + i++));
    }
    ASSERT_EQ(clEnqueueReleaseGLObjects(fQueue, kBuffers, memory.data(), 0, nullptr, nullptr),
              CL_SUCCESS);
    clFinish(fQueue);
    for (cl_int i = 1000; const GLuint buffer : buffers)
        EXPECT_EQ(readGl(buffer, fCount), from(i++));
}

// Threads without an OpenGL context, each with its own queue and buffer.
TEST_F(BufferContentsTest, ConcurrentQueuesTransferTheirOwnBuffers)
{
    constexpr std::size_t kThreads = 4;
    constexpr cl_int kRounds = 50;
    std::array<GLuint, kThreads> buffers{};
    std::vector<std::jthread> threads;
    for (cl_int first = 0; GLuint & buffer : buffers) {
        buffer = makeGlBuffer(Numbers(fCount, 0));
        glFinish();
        threads.emplace_back([this, first, memory = share(buffer)] {
            const Queue queue(fContext, fDevice);
            for (cl_int value = first; value < first + kRounds; ++value) {
                EXPECT_EQ(queue.acquire(memory), CL_SUCCESS);
                queue.fill(memory, value);
                EXPECT_EQ(queue.release(memory), CL_SUCCESS);
            }
            clFinish(queue);
        });
        ++first;
    }
    threads.clear();
    for (cl_int last = kRounds - 1; const GLuint buffer : buffers)
        EXPECT_EQ(readGl(buffer, fCount), Numbers(fCount, last++));
}

} // namespace
