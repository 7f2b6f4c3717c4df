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

    // glXCreateNewContext creates a context with the compatibility profile.
    void openGl() override
    {
        fDisplay = XOpenDisplay(nullptr);
        if (fDisplay == nullptr)
            GTEST_SKIP() << "no X display";
        const std::array<int, 5> wanted{GLX_DRAWABLE_TYPE, GLX_PBUFFER_BIT, GLX_RENDER_TYPE,
                                        GLX_RGBA_BIT, None};
        int count = 0;
        GLXFBConfig* configs = glXChooseFBConfig(fDisplay, 0, wanted.data(), &count);
        ASSERT_GT(count, 0);
        const int noAttributes = None; // some drivers require a list
        fSurface = glXCreatePbuffer(fDisplay, *configs, &noAttributes);
        fGlx = glXCreateNewContext(fDisplay, *configs, GLX_RGBA_TYPE, nullptr, True);
        XFree(configs);
        ASSERT_NE(fGlx, nullptr);
        ASSERT_TRUE(glXMakeContextCurrent(fDisplay, fSurface, fSurface, fGlx));
        fGlEntries = {CL_GL_CONTEXT_KHR, reinterpret_cast<cl_context_properties>(fGlx),
                      CL_GLX_DISPLAY_KHR, reinterpret_cast<cl_context_properties>(fDisplay)};
    }

    void TearDown() override
    {
        fMemory = nullptr;
        fQueue = Queue();
        fContext = nullptr;
        closeGl();
    }

    void closeGl()
    {
        if (fDisplay == nullptr)
            return;
        glXMakeContextCurrent(fDisplay, None, None, nullptr);
        if (fGlx != nullptr)
            glXDestroyContext(fDisplay, fGlx);
        glXDestroyPbuffer(fDisplay, fSurface);
        XCloseDisplay(fDisplay);
        fDisplay = nullptr;
    }

    Display* fDisplay = nullptr;
    GLXPbuffer fSurface = 0;
    GLXContext fGlx = nullptr;
};

TEST_F(GlxTest, RewriteWhileAnotherThreadDrawsReachesOpenGl)
{
    fQueue.rewrite(fMemory, from(1), from(0));
    EXPECT_EQ(readGl(fBuffer, fCount), from(0));
    std::jthread deformer([this] {
        for (cl_int i = 0; i < 50; ++i)
            fQueue.rewrite(fMemory, from(i), from(i + 1));
    });
    for (int i = 0; i < 200; ++i) {
        glClear(GL_COLOR_BUFFER_BIT);
        glFinish();
    }
    deformer.join();
    EXPECT_EQ(readGl(fBuffer, fCount), from(50));
}

// The layer ignores X errors of its own requests only.
TEST_F(GlxTest, CreateContextPassesEarlierXErrorsToTheApplication)
{
    static int errors = 0;
    const XErrorHandler before = XSetErrorHandler([](Display*, XErrorEvent*) { return ++errors; });
    XMapWindow(fDisplay, None);
    EXPECT_NE(makeContext(), nullptr);
    XSync(fDisplay, False);
    XSetErrorHandler(before);
    EXPECT_EQ(errors, 1);
}

// OpenCL still uses the buffer when the display closes. The layer then leaks the buffer's storage
// on purpose, so this test runs without leak detection.
using GlxDisplayTest = GlxTest;
TEST_F(GlxDisplayTest, AcquireAfterDisplayClosedReturnsInvalidGlObject)
{
    ASSERT_EQ(fQueue.acquire(fMemory), CL_SUCCESS);
    closeGl();
    fQueue.write(fMemory, from(3));
    EXPECT_EQ(fQueue.read(fMemory, fCount), from(3));
    EXPECT_EQ(fQueue.release(fMemory), CL_SUCCESS);
    EXPECT_EQ(fQueue.acquire(fMemory), CL_INVALID_GL_OBJECT);
    cl_int error = CL_SUCCESS;
    EXPECT_EQ(clCreateFromGLBuffer(fContext, CL_MEM_READ_WRITE, fBuffer, &error), nullptr);
    EXPECT_EQ(error, CL_INVALID_GL_OBJECT);
    clFinish(fQueue);
}

} // namespace
