// A buffer that several threads and contexts use at the same time. The test finds crashes, hangs,
// OpenGL errors that the program has not caused, and wrong contents. The environment variable
// GLSHARE_STRESS_ROUNDS sets the number of rounds.
#include "SharingTest.h"
#include "StressRounds.h"

#include <algorithm>
#include <atomic>
#include <shared_mutex>
#include <thread>

namespace {

class StressTest : public SharingTest {
protected:
    StressTest() : SharingTest(1000) {}

    void SetUp() override
    {
        ASSERT_NO_FATAL_FAILURE(SharingTest::SetUp());
        if (!IsSkipped())
            prepareDrawing();
    }

    // Prepares to draw points from the buffer, without rasterisation.
    void prepareDrawing() const
    {
        const char* text = "#version 450\nlayout(location = 0) in int number;"
                           "void main() { gl_Position = vec4(number, 0, 0, 1); }";
        glUseProgram(glCreateShaderProgramv(GL_VERTEX_SHADER, 1, &text));
        bindEmptyFramebuffer(1);
        glBindBuffer(GL_ARRAY_BUFFER, fBuffer);
        glVertexAttribIPointer(0, 1, GL_INT, 0, nullptr);
        glEnableVertexAttribArray(0);
        glEnable(GL_RASTERIZER_DISCARD);
        ASSERT_EQ(glGetError(), GLenum{GL_NO_ERROR});
    }

    // Creates and releases memory objects from the buffer, and uses every tenth.
    void createObjects(cl_context context)
    {
        const Queue queue(context, fDevice);
        for (int i = 0; i < 100; ++i) {
            std::shared_lock noGlUse(fTurn, std::defer_lock);
            if (isZeroCopy())
                noGlUse.lock(); // required by zero copy: no OpenGL use of the buffer
            const Memory memory = share(context, fBuffer);
            if (noGlUse)
                noGlUse.unlock();
            EXPECT_NE(infoOf<cl_mem_flags>(clGetMemObjectInfo, memory, CL_MEM_FLAGS), 0U);
            if (i % 10 == 0)
                useObject(queue, memory);
        }
    }

    // No other thread uses the buffer from the acquire to the release.
    void useObject(const Queue& queue, cl_mem memory)
    {
        const std::scoped_lock turn(fTurn);
        ASSERT_EQ(queue.acquire(memory), CL_SUCCESS);
        EXPECT_EQ(queue.read(memory, fCount), from(fFirst));
        queue.write(memory, from(++fFirst));
        ASSERT_EQ(queue.release(memory), CL_SUCCESS);
        clFinish(queue);
    }

    // Maps, writes and draws the buffer, while other threads may create memory objects from it.
    void useGl()
    {
        const std::scoped_lock turn(fTurn);
        glBindBuffer(GL_ARRAY_BUFFER, fBuffer);
        auto* const numbers = static_cast<cl_int*>(glMapBuffer(GL_ARRAY_BUFFER, GL_READ_WRITE));
        ASSERT_NE(numbers, nullptr);
        EXPECT_EQ(Numbers(numbers, numbers + fCount), from(fFirst));
        std::ranges::copy(from(++fFirst), numbers);
        ASSERT_EQ(glUnmapBuffer(GL_ARRAY_BUFFER), GL_TRUE);
        glDrawArrays(GL_POINTS, 0, static_cast<GLsizei>(fCount));
        overwrite(fBuffer, from(++fFirst));
        glFinish();
        ASSERT_EQ(glGetError(), GLenum{GL_NO_ERROR});
    }

    // Runs createObjects on `threads` threads, each with its own OpenCL context, and useGl on this
    // one. If `haveGl`, each thread has a current OpenGL context.
    void onThreads(std::size_t threads, bool haveGl)
    {
        std::atomic<std::size_t> running = threads;
        std::vector<std::jthread> creators;
        for (std::size_t i = 0; i < threads; ++i) {
            creators.emplace_back([&, this] {
                const EglTestContext own(haveGl ? fGl.get() : nullptr);
                if (haveGl)
                    own.makeCurrent();
                createObjects(makeContext(properties(haveGl ? own.entries() : fGlEntries)));
                EglTestContext::releaseCurrent();
                --running;
            });
        }
        while (running > 0 && !HasFatalFailure())
            useGl();
    }

    std::shared_mutex fTurn; // guards the buffer's contents, and:
    cl_int fFirst = 1;       // its first number
};

TEST_F(StressTest, ObjectsCreatedWhileOpenGlUsesTheBufferStayCorrect)
{
    for (int round = 0; round < stressRounds(1) && !HasFailure(); ++round) {
        for (const std::size_t threads : {1U, 2U, 4U}) {
            for (const bool haveGl : {false, true})
                onThreads(threads, haveGl);
        }
    }
}

} // namespace
