// How a process may end. A crash or a hang on the way out is what these tests look for, so that
// each of them belongs in a process of its own.
#include "SharingTest.h"

#include <chrono>
#include <cstdlib>
#include <thread>

namespace {

// One of everything, in the order in which it is made.
struct Everything {
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

// What the test has made and left. Never destroyed by itself.
Everything& theRest()
{
    static auto* const theOne = new Everything;
    return *theOne;
}

// Releases at exit, after the exit handlers that came later than it.
std::unique_ptr<Everything, void (*)(Everything*)> theOwner(nullptr, [](Everything* everything) {
    everything->closeCl();
});

class ExitOrder : public SharingTest {
protected:
    // Large enough to be unmapped when it is freed.
    ExitOrder() : SharingTest(std::size_t{1} << 18) {}

    void SetUp() override
    {
        ASSERT_NO_FATAL_FAILURE(SharingTest::SetUp());
        if (IsSkipped())
            return;
        ASSERT_NO_FATAL_FAILURE(queue_.rewrite(memory_, from(1), from(2)));
        theRest() = {std::move(gl_), std::move(context_), std::move(queue_), std::move(memory_)};
    }
};

TEST_F(ExitOrder, NothingReleased) {}

TEST_F(ExitOrder, EverythingReleased)
{
    theRest().closeCl();
    theRest().closeGl();
}

TEST_F(ExitOrder, GlFirst)
{
    theRest().closeGl();
    // May succeed or fail, as the driver keeps its objects or not.
    theRest().queue.acquire(theRest().memory);
    theRest().queue.release(theRest().memory);
    theRest().closeCl();
}

TEST_F(ExitOrder, GlOnly)
{
    theRest().closeGl();
}

TEST_F(ExitOrder, StaticOwner)
{
    theOwner.reset(&theRest());
}

// What the layer has registered itself runs between the two.
TEST_F(ExitOrder, GlInAHandlerAndStaticOwner)
{
    std::atexit([] { theRest().closeGl(); });
    theOwner.reset(&theRest());
}

TEST_F(ExitOrder, PendingCommands)
{
    EglTestContext::releaseCurrent();
    cl_event gate = clCreateUserEvent(theRest().context, nullptr);
    EXPECT_EQ(theRest().queue.acquire(theRest().memory, {gate}), CL_SUCCESS);
    EXPECT_EQ(theRest().queue.release(theRest().memory), CL_SUCCESS);
    clFlush(theRest().queue);
}

// The process ends while another thread is in the middle of its work.
TEST_F(ExitOrder, BusyThread)
{
    EglTestContext::releaseCurrent();
    std::thread([] {
        for (;;) {
            theRest().queue.acquire(theRest().memory);
            theRest().queue.release(theRest().memory);
            clFinish(theRest().queue);
        }
    }).detach();
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
}

TEST_F(ExitOrder, ExitOnOtherThread)
{
    onOtherThread([] { std::exit(HasFailure() ? 1 : 0); });
}

} // namespace
