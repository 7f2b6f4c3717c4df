// Sharing through GLX and an X display.
#define GL_GLEXT_PROTOTYPES 1

#include "VirtualDisplay.h"

// Before the headers of X, whose macros would break it.
#include <gtest/gtest.h>

#include <CL/cl.h>
#include <CL/cl_gl.h>
#include <GL/gl.h>
#include <GL/glext.h>
#include <GL/glx.h>

#include <array>
#include <memory>
#include <numeric>
#include <thread>
#include <vector>

namespace {

constexpr std::size_t kCount = 300000; // large enough to be unmapped when it is freed
constexpr std::size_t kBytes = kCount * sizeof(cl_int);

using Numbers = std::vector<cl_int>;

Numbers numbersFrom(cl_int first)
{
    Numbers numbers(kCount);
    std::iota(numbers.begin(), numbers.end(), first);
    return numbers;
}

// A display connection, an OpenGL context that is current on the test's thread, and an OpenCL
// context, a queue and a memory object that share with it.
class GlxTest : public testing::Test {
protected:
    static void SetUpTestSuite() { screen_ = std::make_unique<VirtualDisplay>(); }
    static void TearDownTestSuite() { screen_.reset(); }

    void SetUp() override
    {
        if (!screen_->valid())
            GTEST_SKIP() << "no X display, and no Xvfb to make one";
        cl_platform_id platform = nullptr;
        if (clGetPlatformIDs(1, &platform, nullptr) != CL_SUCCESS)
            GTEST_SKIP() << "no OpenCL runtime here";
        display_ = XOpenDisplay(nullptr);
        ASSERT_NE(display_, nullptr);
        openGl();
        openCl(platform);
    }

    void TearDown() override
    {
        if (memory_ != nullptr)
            clReleaseMemObject(memory_);
        if (queue_ != nullptr)
            clReleaseCommandQueue(queue_);
        if (context_ != nullptr)
            clReleaseContext(context_);
        closeGl();
    }

    // The plain way into GLX, which gives a context with the compatibility profile.
    void openGl()
    {
        const std::array<int, 5> wanted{GLX_DRAWABLE_TYPE, GLX_PBUFFER_BIT, GLX_RENDER_TYPE,
                                        GLX_RGBA_BIT, None};
        int count = 0;
        GLXFBConfig* configs = glXChooseFBConfig(display_, 0, wanted.data(), &count);
        ASSERT_GT(count, 0);
        const std::array<int, 1> attributes{None};
        surface_ = glXCreatePbuffer(display_, *configs, attributes.data());
        gl_ = glXCreateNewContext(display_, *configs, GLX_RGBA_TYPE, nullptr, True);
        XFree(configs);
        ASSERT_NE(gl_, nullptr);
        ASSERT_TRUE(glXMakeContextCurrent(display_, surface_, surface_, gl_));
        const Numbers numbers = numbersFrom(1);
        glGenBuffers(1, &buffer_);
        glBindBuffer(GL_ARRAY_BUFFER, buffer_);
        glBufferData(GL_ARRAY_BUFFER, kBytes, numbers.data(), GL_DYNAMIC_DRAW);
    }

    void openCl(cl_platform_id platform)
    {
        const std::array<cl_context_properties, 7> properties{
            CL_CONTEXT_PLATFORM,
            reinterpret_cast<cl_context_properties>(platform),
            CL_GL_CONTEXT_KHR,
            reinterpret_cast<cl_context_properties>(gl_),
            CL_GLX_DISPLAY_KHR,
            reinterpret_cast<cl_context_properties>(display_),
            0};
        cl_device_id device = nullptr;
        ASSERT_EQ(clGetDeviceIDs(platform, CL_DEVICE_TYPE_GPU, 1, &device, nullptr), CL_SUCCESS);
        cl_int error = CL_SUCCESS;
        context_ = clCreateContext(properties.data(), 1, &device, nullptr, nullptr, &error);
        ASSERT_EQ(error, CL_SUCCESS);
        queue_ = clCreateCommandQueue(context_, device, 0, &error);
        memory_ = clCreateFromGLBuffer(context_, CL_MEM_READ_WRITE, buffer_, &error);
        ASSERT_EQ(error, CL_SUCCESS);
    }

    void closeGl()
    {
        if (display_ == nullptr)
            return;
        glXMakeContextCurrent(display_, None, None, nullptr);
        if (gl_ != nullptr)
            glXDestroyContext(display_, gl_);
        glXDestroyPbuffer(display_, surface_);
        XCloseDisplay(display_);
        display_ = nullptr;
    }

    cl_int acquire() const
    {
        return clEnqueueAcquireGLObjects(queue_, 1, &memory_, 0, nullptr, nullptr);
    }
    cl_int release() const
    {
        return clEnqueueReleaseGLObjects(queue_, 1, &memory_, 0, nullptr, nullptr);
    }
    void write(const Numbers& numbers) const
    {
        EXPECT_EQ(clEnqueueWriteBuffer(queue_, memory_, CL_TRUE, 0, kBytes, numbers.data(), 0,
                                       nullptr, nullptr),
                  CL_SUCCESS);
    }
    [[nodiscard]] Numbers read() const
    {
        Numbers numbers(kCount);
        EXPECT_EQ(clEnqueueReadBuffer(queue_, memory_, CL_TRUE, 0, kBytes, numbers.data(), 0,
                                      nullptr, nullptr),
                  CL_SUCCESS);
        return numbers;
    }

    static std::unique_ptr<VirtualDisplay> screen_;
    Display* display_ = nullptr;
    GLXPbuffer surface_ = 0;
    GLXContext gl_ = nullptr;
    GLuint buffer_ = 0;
    cl_context context_ = nullptr;
    cl_command_queue queue_ = nullptr;
    cl_mem memory_ = nullptr;
};

std::unique_ptr<VirtualDisplay> GlxTest::screen_;

TEST_F(GlxTest, WritesCrossInBothDirections)
{
    ASSERT_EQ(acquire(), CL_SUCCESS);
    EXPECT_EQ(read(), numbersFrom(1));
    write(numbersFrom(50));
    ASSERT_EQ(release(), CL_SUCCESS);
    Numbers seen(kCount);
    glGetBufferSubData(GL_ARRAY_BUFFER, 0, kBytes, seen.data());
    EXPECT_EQ(seen, numbersFrom(50));
}

TEST_F(GlxTest, ThreadsWithoutContextShareWhileTheContextIsInUse)
{
    std::thread deformer([this] {
        for (cl_int i = 0; i < 50; ++i) {
            EXPECT_EQ(acquire(), CL_SUCCESS);
            write(numbersFrom(i));
            EXPECT_EQ(release(), CL_SUCCESS);
        }
        clFinish(queue_);
    });
    for (int i = 0; i < 200; ++i) {
        glClear(GL_COLOR_BUFFER_BIT);
        glFinish();
    }
    deformer.join();
    Numbers seen(kCount);
    glGetBufferSubData(GL_ARRAY_BUFFER, 0, kBytes, seen.data());
    EXPECT_EQ(seen, numbersFrom(49));
}

// The order no application should choose: OpenCL is still at work when the display goes. What it
// works on is left behind on purpose, so that this test runs without a search for leaks.
using GlxDisplayTest = GlxTest;
TEST_F(GlxDisplayTest, ClosingTheDisplayFirstIsRefusedAfterwardsAndHarmless)
{
    ASSERT_EQ(acquire(), CL_SUCCESS);
    closeGl();
    write(numbersFrom(3));
    EXPECT_EQ(read(), numbersFrom(3));
    EXPECT_EQ(release(), CL_SUCCESS);
    EXPECT_EQ(acquire(), CL_INVALID_GL_OBJECT);
    cl_int error = CL_SUCCESS;
    EXPECT_EQ(clCreateFromGLBuffer(context_, CL_MEM_READ_WRITE, buffer_, &error), nullptr);
    EXPECT_EQ(error, CL_INVALID_GL_OBJECT);
    clFinish(queue_);
}

} // namespace
