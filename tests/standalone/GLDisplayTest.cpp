#include "GLFixture.h"

#include "host/GLDisplay.h"

#include <CL/cl_gl.h>

#include <thread>

namespace {

using GLDisplayTest = GLTest;

TEST_P(GLDisplayTest, DisplayIsThatOfCurrentContext)
{
    using namespace QNativeInterface;
    const bool isEGL = std::get<std::string>(GetParam()) == "xcb_egl";
    const auto* const egl = context().nativeInterface<QEGLContext>();
    if (isEGL && !egl)
        GTEST_SKIP() << "this Qt creates no EGL contexts on X";
    const void* display =
        egl ? egl->display() : qGuiApp->nativeInterface<QX11Application>()->display();
    const GLDisplayProperty property = glDisplayProperty(nullptr);
    EXPECT_EQ(property.name, isEGL ? CL_EGL_DISPLAY_KHR : CL_GLX_DISPLAY_KHR);
    EXPECT_EQ(property.value, reinterpret_cast<cl_context_properties>(display));
    EXPECT_NE(property.value, 0);

    std::jthread([] {
        EXPECT_EQ(glDisplayProperty(nullptr).name, CL_GLX_DISPLAY_KHR);
        EXPECT_EQ(glDisplayProperty(nullptr).value, 0) << "this thread has no context";
    }).join();
}

INSTANTIATE_TEST_SUITE_P(Contexts, GLDisplayTest, kAllGLKinds, nameOf);

} // namespace
