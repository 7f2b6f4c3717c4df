#include "GLFixture.h"

#include "tests/support/KeepModulesLoaded.h"

#include <QtCore/qtestsupport_core.h>

namespace {

// QGuiApplication keeps references to both.
int argumentCount = 1;
char programName[] = "vyra-host-gl-tests";
char* arguments[] = {programName, nullptr};

constexpr int kWindowTimeoutMs = 20'000;

} // namespace

std::string nameOf(const testing::TestParamInfo<GLKind>& info)
{
    const auto& [integration, windowed] = info.param;
    return integration + (windowed ? "_window" : "_offscreen");
}

void GLTest::SetUp()
{
    if (qEnvironmentVariableIsEmpty("DISPLAY"))
        GTEST_SKIP() << "no display";
    const auto& [integration, windowed] = GetParam();
    qputenv("QT_QPA_PLATFORM", "xcb");
    qputenv("QT_XCB_GL_INTEGRATION", integration.c_str());
    fApplication = std::make_unique<QGuiApplication>(argumentCount, arguments);
    if (windowed) {
        fWindow = std::make_unique<QOpenGLWindow>();
        fWindow->resize(64, 64);
        fWindow->show();
        if (!QTest::qWaitFor([this] { return fWindow->isValid(); }, kWindowTimeoutMs))
            GTEST_SKIP() << "no OpenGL window on this display";
    } else {
        fSurface = std::make_unique<QOffscreenSurface>();
        fSurface->create();
        fContext = std::make_unique<QOpenGLContext>();
        if (!fSurface->isValid() || !fContext->create())
            GTEST_SKIP() << "no OpenGL context on this display";
    }
    makeCurrent();
}

GLTest::~GLTest()
{
    keepModulesLoaded();
}

QOpenGLContext& GLTest::context() const
{
    return fWindow != nullptr ? *fWindow->context() : *fContext;
}

void GLTest::makeCurrent() const
{
    if (fWindow != nullptr)
        fWindow->makeCurrent();
    else
        fContext->makeCurrent(fSurface.get());
}
