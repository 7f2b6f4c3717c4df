#include "GLFixture.h"

#include "host/GLDisplay.h"

#include <CL/cl_gl.h>

#include <thread>

namespace {

class GLDisplayTest : public GLTest {
protected:
    // What Qt says of the current context.
    GLDisplayProperty expected() const
    {
        using namespace QNativeInterface;
        if (GetParam().isEGL()) {
            const auto* egl = context().nativeInterface<QEGLContext>();
            return {CL_EGL_DISPLAY_KHR, reinterpret_cast<cl_context_properties>(egl->display())};
        }
        const auto* x11 = qGuiApp->nativeInterface<QX11Application>();
        return {CL_GLX_DISPLAY_KHR, reinterpret_cast<cl_context_properties>(x11->display())};
    }
};

TEST_P(GLDisplayTest, IsThatOfTheCallersContext)
{
    if (GetParam().isEGL() &&
        context().nativeInterface<QNativeInterface::QEGLContext>() == nullptr) {
        GTEST_SKIP() << "this Qt makes no EGL contexts on X";
    }
    const GLDisplayProperty property = glDisplayProperty(nullptr);
    EXPECT_EQ(property.name, expected().name);
    EXPECT_EQ(property.value, expected().value);
    EXPECT_NE(property.value, 0);

    std::jthread([] {
        EXPECT_EQ(glDisplayProperty(nullptr).name, CL_GLX_DISPLAY_KHR);
        EXPECT_EQ(glDisplayProperty(nullptr).value, 0) << "this thread has no context";
    }).join();
}

INSTANTIATE_TEST_SUITE_P(Contexts, GLDisplayTest, testing::ValuesIn(allGLKinds), nameOf);

} // namespace
