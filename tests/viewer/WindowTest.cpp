// The playing window, driven by the events that a user causes.
#include "viewer/Session.h"
#include "viewer/ViewerWindow.h"

#include <filesystem>
#include <memory>

#include <QGuiApplication>
#include <QKeyEvent>
#include <QMouseEvent>
#include <QSurfaceFormat>
#include <QTimer>
#include <QWheelEvent>

#include <gtest/gtest.h>

namespace {

using namespace viewer;

constexpr int kHangMs = 20000;
const QSize kSize(160, 120);

void press(QWindow& window, Qt::Key key)
{
    QKeyEvent event(QEvent::KeyPress, key, Qt::NoModifier);
    QCoreApplication::sendEvent(&window, &event);
}

void moveMouse(QWindow& window, QEvent::Type type, const QPointF& position)
{
    QMouseEvent event(type, position, window.mapToGlobal(position), Qt::LeftButton, Qt::LeftButton,
                      Qt::NoModifier);
    QCoreApplication::sendEvent(&window, &event);
}

void turnWheel(QWindow& window, int notches)
{
    constexpr int kUnitsPerNotch = 120;
    QWheelEvent event(QPointF(), QPointF(), QPoint(), QPoint(0, notches * kUnitsPerNotch),
                      Qt::NoButton, Qt::NoModifier, Qt::NoScrollPhase, false);
    QCoreApplication::sendEvent(&window, &event);
}

// Calls once from the event loop, if it lives long enough.
class Later {
public:
    template <typename Action>
    Later(int milliseconds, Action action)
    {
        fTimer.setSingleShot(true);
        fTimer.callOnTimeout(action);
        fTimer.start(milliseconds);
    }

private:
    QTimer fTimer;
};

class WindowTest : public testing::Test {
protected:
    void SetUp() override
    {
        if (!std::filesystem::exists("/usr/share/assimp/models/X/Testwuson.X"))
            GTEST_SKIP() << "the sample models (package assimp-testmodels) are not installed";
        if (qEnvironmentVariableIsEmpty("DISPLAY"))
            GTEST_SKIP() << "there is no display, and no Xvfb to make one";
        QSurfaceFormat format;
        format.setVersion(3, 3);
        format.setProfile(QSurfaceFormat::CoreProfile);
        format.setSwapInterval(0);
        QSurfaceFormat::setDefaultFormat(format);
        fApplication = std::make_unique<QGuiApplication>(fArguments, fNames);
        fOptions.model = "X/Testwuson.X";
        fOptions.allowCpu = true;
        fOptions.verify = true;
        fWindow = std::make_unique<ViewerWindow>();
        ASSERT_FALSE(fWindow->open(kSize));
        fWindow->makeCurrent();
        fSession = std::make_unique<Session>(fOptions, *fWindow);
        const Status failure = fSession->start(kSize);
        ASSERT_FALSE(failure) << failure->text;
    }

    void TearDown() override
    {
        fSession.reset(); // the context is current
    }

    // Plays until Escape, which comes after `frames` more frames. False when that never happens.
    bool playFor(int frames)
    {
        int left = frames;
        const auto counting = QObject::connect(fWindow.get(), &QOpenGLWindow::frameSwapped, [&] {
            if (--left == 0)
                press(*fWindow, Qt::Key_Escape);
        });
        const Later hang(kHangMs, [] { QGuiApplication::exit(); });
        fWindow->play(*fSession);
        QGuiApplication::exec();
        QObject::disconnect(counting);
        fWindow->stop();
        fWindow->makeCurrent();
        return left <= 0;
    }

    int fArguments = 1;
    char fName[12] = "window-test";
    char* fNames[2] = {fName, nullptr};
    std::unique_ptr<QGuiApplication> fApplication;
    Options fOptions;
    std::unique_ptr<ViewerWindow> fWindow;
    std::unique_ptr<Session> fSession;
};

TEST_F(WindowTest, PlaysUntilEscapeWithEveryFrameRight)
{
    EXPECT_TRUE(playFor(5));
    EXPECT_FALSE(fWindow->failure());
    EXPECT_TRUE(fSession->verified());
}

TEST_F(WindowTest, OrbitsZoomsAndResizes)
{
    const Later act(0, [&] {
        const QVector3D eye = fSession->camera().eye();
        moveMouse(*fWindow, QEvent::MouseButtonPress, {10, 10});
        moveMouse(*fWindow, QEvent::MouseMove, {60, 10});
        const QVector3D turned = fSession->camera().eye();
        EXPECT_GT((turned - eye).length(), 0.1f);
        EXPECT_NEAR(turned.y(), eye.y(), 1e-4f);

        moveMouse(*fWindow, QEvent::MouseMove, {60, 40});
        const QVector3D raised = fSession->camera().eye();
        EXPECT_GT(raised.y(), turned.y());

        turnWheel(*fWindow, 3);
        EXPECT_LT(fSession->camera().eye().length(), raised.length());
        fWindow->resize(200, 100);
    });
    EXPECT_TRUE(playFor(8));
    EXPECT_EQ(fSession->canvas().size(), QSize(200, 100) * fWindow->devicePixelRatio());
    EXPECT_TRUE(fSession->verified());
}

TEST_F(WindowTest, TheDetailKeyReplacesTheVertexBuffers)
{
    const std::string before = fSession->report();
    press(*fWindow, Qt::Key_D); // without effect: nothing plays yet
    const Later act(0, [&] { press(*fWindow, Qt::Key_D); });
    EXPECT_TRUE(playFor(4));
    EXPECT_TRUE(fSession->verified());
    EXPECT_NE(before.find("3205 vertices"), std::string::npos) << before;
    EXPECT_EQ(fSession->report().find("3205 vertices"), std::string::npos);
}

} // namespace
