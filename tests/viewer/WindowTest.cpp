// The window, driven by user events and by kernels that change on disk: every frame matches the CPU
// reference, and Escape ends playing.
#include "tests/support/KeepModulesLoaded.h"
#include "viewer/app/Player.h"

#include "runtime/TopenCLInfo.h"
#include "viewer/app/LoadProgress.h"
#include "viewer/app/Session.h"
#include "viewer/app/ViewerWindow.h"

#include <filesystem>
#include <functional>
#include <memory>

#include <QElapsedTimer>
#include <QFile>
#include <QGuiApplication>
#include <QImage>
#include <QKeyEvent>
#include <QMouseEvent>
#include <QSurfaceFormat>
#include <QTemporaryDir>
#include <QWheelEvent>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace viewer;
using testing::AllOf, testing::HasSubstr, testing::Not;

constexpr int kUnitsPerStep = 120; // of the wheel
constexpr int kFramesAfterEscape = 60;
constexpr qint64 kSliceMs = 100;
constexpr int kLeastFrames = 5; // even if they take longer
constexpr qint64 kHangMs = 20000;
const QSize kSize(160, 120);

void press(QWindow& window, Qt::Key key)
{
    QKeyEvent event(QEvent::KeyPress, key, Qt::NoModifier);
    QCoreApplication::sendEvent(&window, &event);
}

void moveMouse(QWindow& window, QEvent::Type type, const QPointF& position,
               Qt::MouseButton button = Qt::LeftButton)
{
    QMouseEvent event(type, position, window.mapToGlobal(position), button, button, Qt::NoModifier);
    QCoreApplication::sendEvent(&window, &event);
}

class WindowTest : public testing::Test {
protected:
    WindowTest() { fOptions.model = "X/Testwuson.X"; }

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
        fOptions.deformers = parseDeformers(kDefaultDeformers).value();
        fOptions.allowCpu = true;
        fOptions.verify = true;
        fWindow = std::make_unique<ViewerWindow>();
        ASSERT_FALSE(fWindow->open(kSize));
        fWindow->makeCurrent();
        fSession = std::make_unique<Session>(fOptions, *fWindow);
        const Status failure = fSession->start(kSize);
        ASSERT_FALSE(failure) << failure->text;
    }

    void TearDown() override { keepModulesLoaded(); }

    // Plays, calls `action` after the first frame, presses Escape after `frames` frames, and
    // expects that playing ends and all frames match the CPU reference.
    void playFor(int frames, const std::function<void()>& action)
    {
        int left = frames;
        const auto counting = QObject::connect(fWindow.get(), &QOpenGLWindow::frameSwapped, [&] {
            if (left == frames)
                action();
            if (--left == 0)
                press(*fWindow, Qt::Key_Escape);
            else if (left == -kFramesAfterEscape)
                QGuiApplication::exit();
        });
        fWindow->play(*fSession);
        QGuiApplication::exec();
        QObject::disconnect(counting);
        fWindow->stop();
        fWindow->makeCurrent();
        EXPECT_LE(left, 0) << "playing ended early";
        EXPECT_GT(left, -kFramesAfterEscape) << "Escape did not end playing";
        EXPECT_FALSE(fWindow->failure());
        EXPECT_TRUE(fSession->verified());
    }

    // Renders frames until one differs from the CPU reference or the time is over.
    void playWhileVerified(Player& player, qint64 milliseconds)
    {
        QElapsedTimer timer;
        timer.start();
        for (int frames = 0;
             fSession->verified() && (frames < kLeastFrames || timer.elapsed() < milliseconds);
             ++frames) {
            ASSERT_FALSE(player.renderFrame());
            QGuiApplication::processEvents();
            fWindow->makeCurrent();
        }
    }

    int fArguments = 1;
    char fName[12] = "window-test";
    char* fNames[2] = {fName, nullptr};
    std::unique_ptr<QGuiApplication> fApplication;
    Options fOptions;
    std::unique_ptr<ViewerWindow> fWindow;
    std::unique_ptr<Session> fSession; // destroyed first, while the context is current
};

TEST_F(WindowTest, MouseMovesCameraAndKeyChangesLevelOfDetailWhilePlaying)
{
    const std::string before = fSession->report();
    press(*fWindow, Qt::Key_D); // no effect: nothing plays yet
    playFor(8, [&] {
        const QVector3D eye = fSession->camera().eye();
        moveMouse(*fWindow, QEvent::MouseButtonPress, {10, 10});
        moveMouse(*fWindow, QEvent::MouseMove, {60, 10});
        const QVector3D turned = fSession->camera().eye();
        EXPECT_GT((turned - eye).length(), 0.1f);
        EXPECT_NEAR(turned.y(), eye.y(), 0.05f);

        moveMouse(*fWindow, QEvent::MouseMove, {60, 40});
        const QVector3D raised = fSession->camera().eye();
        EXPECT_GT(raised.y(), turned.y());

        QWheelEvent wheel({}, {}, {}, QPoint(0, 3 * kUnitsPerStep), Qt::NoButton, Qt::NoModifier,
                          Qt::NoScrollPhase, false);
        QCoreApplication::sendEvent(fWindow.get(), &wheel);
        EXPECT_LT(fSession->camera().eye().length(), raised.length());
        const QVector3D near = fSession->camera().eye();
        moveMouse(*fWindow, QEvent::MouseMove, {80, 40}, Qt::RightButton);
        EXPECT_GT((fSession->camera().eye() - near).length(), 0.01f);
        press(*fWindow, Qt::Key_Home);
        EXPECT_LT((fSession->camera().eye() - eye).length(), 1e-4f);
        fWindow->resize(200, 1); // below the minimum height
        press(*fWindow, Qt::Key_D);
    });
    EXPECT_EQ(fSession->canvas().size(), QSize(200, 90) * fWindow->devicePixelRatio());
    EXPECT_THAT(before, HasSubstr("3205 vertices"));
    EXPECT_THAT(fSession->report(), Not(HasSubstr("3205 vertices")));
}

TEST_F(WindowTest, LoadProgressUpdatesTitleAndPrintsPeriodically)
{
    testing::internal::CaptureStderr();
    {
        LoadProgress progress(*fWindow, "a.fbx");
        for (const int seconds : {0, 1, 1, 2, 3, 4, 5, 6})
            EXPECT_TRUE(progress.show(seconds));
        EXPECT_EQ(fWindow->title(), "vyra-viewer: loading 'a.fbx', 6 s so far");
    }
    EXPECT_EQ(fWindow->title(), "vyra-viewer");
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "vyra-viewer: loading 'a.fbx', 1 s so far\n"
                                                      "vyra-viewer: loading 'a.fbx', 5 s so far\n");
}

TEST_F(WindowTest, ChangedKernelIsReloadedUnlessItDoesNotBuild)
{
    if (!TopenCLInfo::isValid())
        GTEST_SKIP() << "OpenCL cannot be used here";
    const QTemporaryDir resources;
    std::filesystem::copy(vyra::Evaluator::kernelDirectory(),
                          resources.filePath("kernels").toStdString());
    TopenCLInfo::theOne().getAbsolutePathToResources() = resources.path().toUtf8().constData();
    QFile file(resources.filePath("kernels/twist.cl"));
    ASSERT_TRUE(file.open(QIODevice::ReadOnly));
    const QByteArray original = file.readAll();
    Player player(*fSession);
    const auto edit = [&](const char* from, const char* to) {
        file.close();
        ASSERT_TRUE(file.open(QIODevice::WriteOnly));
        file.write(QByteArray(original).replace(from, to));
        file.close();
    };
    edit("unitScale(", "unitScal(");
    QElapsedTimer timer;
    timer.start();
    std::string errors;
    while (errors.empty() && timer.elapsed() < kHangMs) {
        testing::internal::CaptureStderr();
        playWhileVerified(player, kSliceMs);
        errors = testing::internal::GetCapturedStderr();
    }
    EXPECT_THAT(errors, AllOf(HasSubstr("does not compile"), HasSubstr("'unitScal'")));
    EXPECT_TRUE(fSession->verified());
    edit("sineAndCosine(twist", "sineAndCosine(2.0f * twist");
    playWhileVerified(player, kHangMs);
    EXPECT_FALSE(fSession->verified()) << "the corrected kernel was not loaded";
}

// A square at y = 0, where the ground is drawn.
class FlatModelTest : public WindowTest {
protected:
    FlatModelTest()
    {
        fOptions.model = fFolder.filePath("flat.obj").toStdString();
        QFile file(fFolder.filePath("flat.obj"));
        if (file.open(QIODevice::WriteOnly))
            file.write("v 0 0 0\nv 1 0 0\nv 1 0 1\nv 0 0 1\nf 1 4 3 2\n");
    }

private:
    const QTemporaryDir fFolder;
};

TEST_F(FlatModelTest, GroundDoesNotHideAModelAtItsHeight)
{
    Player player(*fSession);
    ASSERT_FALSE(player.renderFrame());
    const QImage picture = fSession->canvas().image();
    for (const float x : {-0.4f, -0.2f, 0.0f, 0.2f, 0.4f}) {
        for (const float z : {-0.4f, -0.2f, 0.0f, 0.2f, 0.4f}) {
            const QVector3D place = fSession->camera().toClip().map(QVector3D(x, 0, z));
            const QColor colour = picture.pixelColor(
                static_cast<int>((1 + place.x()) / 2 * static_cast<float>(picture.width())),
                static_cast<int>((1 - place.y()) / 2 * static_cast<float>(picture.height())));
            EXPECT_GT(colour.red(), colour.blue() + 30) << "the ground is grey: " << x << ' ' << z;
        }
    }
}

TEST_F(WindowTest, FramesMatchTheCpuReferenceAfterEachKey)
{
    Player player(*fSession);
    for (const std::size_t index : {1U, 2U, 1U, 9U, 2U}) {
        player.toggleDeformer(index);
        ASSERT_FALSE(player.renderFrame());
        EXPECT_TRUE(fSession->verified()) << index;
    }
    for (const Action action : {Action::kPause, Action::kDeformers, Action::kSideBySide,
                                Action::kDetail, Action::kDeformers, Action::kSideBySide}) {
        player.act(action);
        ASSERT_FALSE(player.renderFrame());
        player.showIn(fWindow->defaultFramebufferObject(), fWindow->size(), 1);
        EXPECT_TRUE(fSession->verified()) << static_cast<int>(action);
    }
}

} // namespace
