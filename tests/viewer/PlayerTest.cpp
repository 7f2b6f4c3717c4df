// What a playing window does beyond drawing: keys, and kernels that change on the disk meanwhile.
// The overlay's texts, too.
#include "viewer/Player.h"
#include "runtime/TopenCLInfo.h"
#include "viewer/OverlayText.h"
#include "viewer/Session.h"
#include "viewer/ViewerWindow.h"

#include <filesystem>
#include <memory>

#include <QElapsedTimer>
#include <QFile>
#include <QGuiApplication>
#include <QSurfaceFormat>
#include <QTemporaryDir>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace viewer;
using testing::AllOf, testing::HasSubstr, testing::Not;

constexpr qint64 kNoticedMs = 500; // a change, by then
constexpr qint64 kHangMs = 20000;

TEST(OverlayText, TellsOnlyWhatIsShown)
{
    OverlayFacts facts{{{"a device", "2, fence", "4, finish", 128}}, 1.5, {}, true, false};
    EXPECT_THAT(overlayText(facts),
                AllOf(HasSubstr("1.50 ms"), HasSubstr("a device\n"), HasSubstr("2, fence\n"),
                      HasSubstr("4, finish\n"), HasSubstr("128 vertex buffers\n"),
                      HasSubstr("paused\n"), HasSubstr("off"), Not(HasSubstr("on the right"))));
    facts = {{}, 1.5, 7.25, false, true};
    EXPECT_THAT(overlayText(facts), AllOf(HasSubstr("7.25 ms"), HasSubstr("OpenCL is not used"),
                                          Not(HasSubstr("Batch")), Not(HasSubstr("paused"))));
}

TEST(OverlayText, CutsALongBuildLog)
{
    EXPECT_EQ(beginningOf("one\ntwo"), "one\ntwo\n");
    const std::string cut = beginningOf(std::string(1000, 'x') + std::string(99, '\n'));
    EXPECT_LT(cut.size(), 200u);
    EXPECT_THAT(cut, HasSubstr("\n... and 83 more lines\n"));
}

class PlayerTest : public testing::Test {
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
        QSurfaceFormat::setDefaultFormat(format);
        fApplication = std::make_unique<QGuiApplication>(fArguments, fNames);
        fOptions.model = "X/Testwuson.X";
        fOptions.verify = true;
        fWindow = std::make_unique<ViewerWindow>();
        ASSERT_FALSE(fWindow->open(QSize(160, 120)));
        fWindow->makeCurrent();
        fSession = std::make_unique<Session>(fOptions, *fWindow);
        if (const Status failure = fSession->start(QSize(160, 120)))
            GTEST_SKIP() << failure->text;
    }

    void writeTwist(const char* from, const char* to)
    {
        QFile file(fResources.filePath("kernels/twist.cl"));
        ASSERT_TRUE(file.open(QIODevice::WriteOnly));
        file.write(QByteArray(fTwist).replace(from, to));
    }

    // Until a frame is not as the CPU would have it, or the time is over.
    void playWhileRight(Player& player, qint64 milliseconds)
    {
        QElapsedTimer timer;
        timer.start();
        while (fSession->verified() && timer.elapsed() < milliseconds) {
            ASSERT_FALSE(player.renderFrame());
            QGuiApplication::processEvents();
            fWindow->makeCurrent();
        }
    }

    int fArguments = 1;
    char fName[12] = "player-test";
    char* fNames[2] = {fName, nullptr};
    QTemporaryDir fResources;
    QByteArray fTwist;
    std::unique_ptr<QGuiApplication> fApplication;
    Options fOptions;
    std::unique_ptr<ViewerWindow> fWindow;
    std::unique_ptr<Session> fSession; // goes first, while the context is current
};

TEST_F(PlayerTest, KeepsTheLastGoodKernelAndTakesTheMendedOne)
{
    namespace fs = std::filesystem;
    Tstring& resources = TopenCLInfo::theOne().getAbsolutePathToResources();
    fs::copy(KernelFiles::folder(), fResources.filePath("kernels").toStdString());
    resources = fResources.path().toUtf8().constData();
    QFile original(fResources.filePath("kernels/twist.cl"));
    ASSERT_TRUE(original.open(QIODevice::ReadOnly));
    fTwist = original.readAll();
    Player player(*fSession);

    testing::internal::CaptureStderr();
    writeTwist("vload3", "vload33");
    playWhileRight(player, kNoticedMs);
    writeTwist("twistPerHeight,\n", "twistPerHeight, const int more,\n");
    playWhileRight(player, kNoticedMs);
    EXPECT_THAT(
        testing::internal::GetCapturedStderr(),
        AllOf(HasSubstr("does not build"), HasSubstr("'vload33'"), HasSubstr("takes 9 arguments")));
    EXPECT_TRUE(fSession->verified());

    writeTwist("const float angle = ", "const float angle = 2.0f * ");
    playWhileRight(player, kHangMs);
    EXPECT_FALSE(fSession->verified()) << "the mended kernel was not taken";
}

TEST_F(PlayerTest, EveryFrameIsRightInEachStateOfTheKeys)
{
    Player player(*fSession);
    for (const Action action : {Action::kPause, Action::kDeformers, Action::kSideBySide,
                                Action::kDetail, Action::kDeformers, Action::kSideBySide}) {
        player.act(action);
        ASSERT_FALSE(player.renderFrame());
        player.showIn(fWindow->defaultFramebufferObject(), fWindow->size(), 1);
        EXPECT_TRUE(fSession->verified()) << static_cast<int>(action);
    }
}

} // namespace
