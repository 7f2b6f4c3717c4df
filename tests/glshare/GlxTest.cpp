// Sharing through GLX and an X display.
#include "SharingTest.h"

// After the headers of the tests, which the macros of X would break.
#include <GL/glx.h>

#include <array>
#include <thread>

namespace {

class GlxTest : public SharingTest {
protected:
    // Large enough to be unmapped when it is freed.
    GlxTest() : SharingTest(300000) {}

    // The plain way into GLX, which gives a context with the compatibility profile.
    void openGl() override
    {
        display_ = XOpenDisplay(nullptr);
        if (display_ == nullptr)
            GTEST_SKIP() << "no X display";
        const std::array<int, 5> wanted{GLX_DRAWABLE_TYPE, GLX_PBUFFER_BIT, GLX_RENDER_TYPE,
                                        GLX_RGBA_BIT, None};
        int count = 0;
        GLXFBConfig* configs = glXChooseFBConfig(display_, 0, wanted.data(), &count);
        ASSERT_GT(count, 0);
        const int noAttributes = None; // some drivers want a list
        surface_ = glXCreatePbuffer(display_, *configs, &noAttributes);
        glx_ = glXCreateNewContext(display_, *configs, GLX_RGBA_TYPE, nullptr, True);
        XFree(configs);
        ASSERT_NE(glx_, nullptr);
        ASSERT_TRUE(glXMakeContextCurrent(display_, surface_, surface_, glx_));
        glEntries_ = {CL_GL_CONTEXT_KHR, reinterpret_cast<cl_context_properties>(glx_),
                      CL_GLX_DISPLAY_KHR, reinterpret_cast<cl_context_properties>(display_)};
    }

    void TearDown() override
    {
        memory_ = nullptr;
        queue_ = Queue();
        context_ = nullptr;
        closeGl();
    }

    void closeGl()
    {
        if (display_ == nullptr)
            return;
        glXMakeContextCurrent(display_, None, None, nullptr);
        if (glx_ != nullptr)
            glXDestroyContext(display_, glx_);
        glXDestroyPbuffer(display_, surface_);
        XCloseDisplay(display_);
        display_ = nullptr;
    }

    Display* display_ = nullptr;
    GLXPbuffer surface_ = 0;
    GLXContext glx_ = nullptr;
};

TEST_F(GlxTest, WritesCrossAlsoFromAThreadWithoutContextWhileTheContextIsInUse)
{
    queue_.rewrite(memory_, from(1), from(0));
    EXPECT_EQ(readGl(buffer_, count_), from(0));
    std::jthread deformer([this] {
        for (cl_int i = 0; i < 50; ++i)
            queue_.rewrite(memory_, from(i), from(i + 1));
    });
    for (int i = 0; i < 200; ++i) {
        glClear(GL_COLOR_BUFFER_BIT);
        glFinish();
    }
    deformer.join();
    EXPECT_EQ(readGl(buffer_, count_), from(50));
}

// Xlib reports the errors of earlier requests at any time, and the layer catches those of its own.
TEST_F(GlxTest, EarlierErrorsReachTheApplication)
{
    static int errors = 0;
    const XErrorHandler before = XSetErrorHandler([](Display*, XErrorEvent*) { return ++errors; });
    XMapWindow(display_, None);
    EXPECT_NE(makeContext(), nullptr);
    XSync(display_, False);
    XSetErrorHandler(before);
    EXPECT_EQ(errors, 1);
}

// The order no application should choose: OpenCL is still at work when the display goes. What it
// works on is left behind on purpose, so that this test runs without a search for leaks.
using GlxDisplayTest = GlxTest;
TEST_F(GlxDisplayTest, ClosingTheDisplayFirstIsRefusedAfterwardsAndHarmless)
{
    ASSERT_EQ(queue_.acquire(memory_), CL_SUCCESS);
    closeGl();
    queue_.write(memory_, from(3));
    EXPECT_EQ(queue_.read(memory_, count_), from(3));
    EXPECT_EQ(queue_.release(memory_), CL_SUCCESS);
    EXPECT_EQ(queue_.acquire(memory_), CL_INVALID_GL_OBJECT);
    cl_int error = CL_SUCCESS;
    EXPECT_EQ(clCreateFromGLBuffer(context_, CL_MEM_READ_WRITE, buffer_, &error), nullptr);
    EXPECT_EQ(error, CL_INVALID_GL_OBJECT);
    clFinish(queue_);
}

} // namespace
