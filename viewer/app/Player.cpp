#include "viewer/app/Player.h"

#include "viewer/app/Session.h"
#include "viewer/overlay/OverlayText.h"

#include <cstdio>

namespace viewer {
namespace {

// Period of updates of the overlay. Numbers that change faster are unreadable.
constexpr qint64 kTextPeriodMs = 250;
constexpr double kMsPerSecond = 1000.0;

} // namespace

double PlayClock::seconds() const
{
    return static_cast<double>(milliseconds()) / kMsPerSecond;
}

void PlayClock::togglePause()
{
    fBeforeMs = milliseconds();
    if (paused())
        fSinceResumed.start();
    else
        fSinceResumed.invalidate();
}

void FrameRate::countFrame()
{
    constexpr qint64 kPeriodMs = 500; // steady enough to be read
    fFrames += 1;
    if (fSincePeriod.elapsed() < kPeriodMs)
        return;
    fPerSecond = fFrames * kMsPerSecond / static_cast<double>(fSincePeriod.restart());
    fFrames = 0;
}

Player::Player(Session& session)
    : fSession(session), fKernelWatcher(QString::fromStdString(session.kernelFolder()))
{
}

Status Player::renderFrame()
{
    reloadChangedKernels();
    fFrameRate.countFrame();
    return fSession.renderFrame(fClock.seconds());
}

void Player::reloadChangedKernels()
{
    for (const ChangedFile& file : fKernelWatcher.changes()) {
        fBuildErrors.erase(file.name);
        fSinceTexts.invalidate();
        const vyra::Status status = fSession.replaceKernelFile(file.name, file.text);
        if (status.ok())
            continue;
        fBuildErrors[file.name] = status.message;
        std::fprintf(stderr, "vyra-viewer: keeping the last good kernel: %s\n",
                     status.message.c_str());
    }
}

void Player::showIn(unsigned framebuffer, const QSize& framebufferSize, double pixelRatio)
{
    fSession.canvas().showIn(framebuffer, framebufferSize);
    if (!fSinceTexts.isValid() || fSinceTexts.elapsed() >= kTextPeriodMs) {
        fOverlay.setTexts(texts(), pixelRatio);
        fSinceTexts.start();
    }
    fOverlay.draw(framebufferSize);
}

// Shows build errors even if the overlay is hidden.
OverlayTexts Player::texts() const
{
    OverlayTexts texts;
    for (const auto& [file, error] : fBuildErrors)
        texts.error += firstLines(error);
    if (!fShowsOverlay)
        return texts;
    OverlayContent content = fSession.overlayContent();
    content.paused = fClock.paused();
    content.keys = keySummary();
    content.framesPerSecond = fFrameRate.perSecond();
    texts.statistics = overlayText(content);
    if (content.cpuSceneMs) {
        texts.leftHalf = content.distribution.allOnCpu() ? "CPU" : "OpenCL";
        texts.rightHalf = "CPU";
    }
    return texts;
}

void Player::toggleDeformer(std::size_t index)
{
    fSinceTexts.invalidate();
    fSession.toggleDeformer(index);
}

void Player::act(Action action)
{
    fSinceTexts.invalidate();
    switch (action) {
    case Action::kPause:
        fClock.togglePause();
        break;
    case Action::kDeformers:
        fSession.toggleDeformers();
        break;
    case Action::kSideBySide:
        fSession.toggleCpuScene();
        break;
    case Action::kDetail:
        fSession.changeDetail();
        break;
    case Action::kOverlay:
        fShowsOverlay = !fShowsOverlay;
        break;
    case Action::kResetView:
        fSession.camera().reset();
        break;
    case Action::kQuit:
        break;
    }
}

} // namespace viewer
