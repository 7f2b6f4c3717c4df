#include "viewer/app/Player.h"

#include "viewer/app/Session.h"
#include "viewer/overlay/OverlayText.h"

#include <cstdio>

namespace viewer {
namespace {

// Numbers that change faster cannot be read.
constexpr qint64 kTextPeriodMs = 250;

} // namespace

Player::Player(Session& session)
    : fSession(session), fKernelWatch(QString::fromStdString(session.kernelFolder()))
{
}

Status Player::renderFrame()
{
    takeChangedKernels();
    fFrameRate.countFrame();
    return fSession.renderFrame(fClock.seconds());
}

void Player::takeChangedKernels()
{
    for (const ChangedFile& file : fKernelWatch.changes()) {
        fComplaints.erase(file.name);
        fSinceTexts.invalidate();
        const vyra::Status status = fSession.replaceKernelFile(file.name, file.text);
        if (status.ok())
            continue;
        fComplaints[file.name] = status.message;
        std::fprintf(stderr, "vyra-viewer: going on with the last good kernel: %s\n",
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

// A kernel that does not build is told also where the rest of the overlay is off.
OverlayTexts Player::texts() const
{
    OverlayTexts texts;
    for (const auto& [file, complaint] : fComplaints)
        texts.problem += beginningOf(complaint);
    if (!fShowsOverlay)
        return texts;
    OverlayFacts facts = fSession.overlayFacts();
    facts.paused = fClock.paused();
    facts.framesPerSecond = fFrameRate.perSecond();
    texts.facts = overlayText(facts);
    if (facts.cpuTwinMs) {
        texts.leftHalf = facts.share.allOnCpu() ? "CPU" : "OpenCL";
        texts.rightHalf = "CPU";
    }
    return texts;
}

void Player::toggleDeformer(std::size_t number)
{
    fSinceTexts.invalidate();
    fSession.toggleDeformer(number);
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
        fSession.toggleCpuTwin();
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
