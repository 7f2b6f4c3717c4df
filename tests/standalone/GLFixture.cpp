#include "GLFixture.h"

#include <QDeadlineTimer>

#include <dlfcn.h>
#include <link.h>

#include <chrono>

namespace {

// QGuiApplication keeps references to both for as long as it lives.
int argumentCount = 1;
char programName[] = "vyra-host-gl-tests";
char* arguments[] = {programName, nullptr};

constexpr auto windowTimeout = std::chrono::seconds(20);

// Keeps what is loaded now until the process ends: what the static objects of a driver hold reads
// as leaked once the driver is unloaded.
void keepModulesLoaded()
{
    dl_iterate_phdr(
        [](dl_phdr_info* module, std::size_t, void*) {
            dlopen(module->dlpi_name, RTLD_NOLOAD | RTLD_NODELETE | RTLD_LAZY);
            return 0;
        },
        nullptr);
}

} // namespace

std::string nameOf(const testing::TestParamInfo<GLKind>& info)
{
    return std::string(info.param.isEGL() ? "Egl" : "Glx") +
           (info.param.windowed ? "Window" : "Offscreen");
}

void GLTest::SetUp()
{
    if (qEnvironmentVariableIsEmpty("DISPLAY")) {
        GTEST_SKIP() << "no display";
    }
    qputenv("QT_QPA_PLATFORM", "xcb");
    qputenv("QT_XCB_GL_INTEGRATION", GetParam().integration);
    fApplication = std::make_unique<QGuiApplication>(argumentCount, arguments);
    if (GetParam().windowed) {
        openWindow();
    } else {
        createOffscreen();
    }
    if (!IsSkipped()) {
        makeCurrent();
    }
}

void GLTest::TearDown()
{
    keepModulesLoaded();
    // A context goes before the surface that it is current on.
    fContext.reset();
}

QOpenGLContext& GLTest::context() const
{
    return fWindow != nullptr ? *fWindow->context() : *fContext;
}

void GLTest::makeCurrent() const
{
    if (fWindow != nullptr) {
        fWindow->makeCurrent();
    } else {
        fContext->makeCurrent(fSurface.get());
    }
}

void GLTest::openWindow()
{
    fWindow = std::make_unique<QOpenGLWindow>();
    fWindow->resize(64, 64);
    fWindow->show();
    const QDeadlineTimer deadline(windowTimeout);
    while (!fWindow->isValid() && !deadline.hasExpired()) {
        QCoreApplication::processEvents(QEventLoop::WaitForMoreEvents, 100);
    }
    if (!fWindow->isValid()) {
        GTEST_SKIP() << "no OpenGL window on this display";
    }
}

void GLTest::createOffscreen()
{
    fSurface = std::make_unique<QOffscreenSurface>();
    fSurface->create();
    fContext = std::make_unique<QOpenGLContext>();
    if (!fSurface->isValid() || !fContext->create()) {
        GTEST_SKIP() << "no OpenGL context on this display";
    }
}
