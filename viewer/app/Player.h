// Plays a session in a window: pausable time, keys, overlay, reload of changed kernels.
#pragma once

#include "viewer/Failure.h"
#include "viewer/app/Controls.h"
#include "viewer/app/KernelWatcher.h"
#include "viewer/overlay/Overlay.h"

#include <cstddef>
#include <map>
#include <string>

#include <QElapsedTimer>
#include <QSize>

namespace viewer {

class Session;

// Clock that starts running when it is constructed.
class PlayClock {
public:
    PlayClock() { fSinceResumed.start(); }

    // Time without pauses.
    [[nodiscard]] double seconds() const;
    [[nodiscard]] bool paused() const { return !fSinceResumed.isValid(); }
    void togglePause();

private:
    qint64 milliseconds() const { return fBeforeMs + (paused() ? 0 : fSinceResumed.elapsed()); }

    qint64 fBeforeMs = 0;        // until the last pause or resumption
    QElapsedTimer fSinceResumed; // invalid while paused
};

// Measures frames per second over periods of about half a second.
class FrameRate {
public:
    FrameRate() { fSincePeriod.start(); }

    // Must be called once in each frame.
    void countFrame();
    // Returns the rate of the last full period, 0 before its end.
    [[nodiscard]] double perSecond() const noexcept { return fPerSecond; }

private:
    QElapsedTimer fSincePeriod;
    int fFrames = 0;
    double fPerSecond = 0;
};

// The window's OpenGL context must be current in all operations, the constructor and the
// destructor.
class Player {
public:
    // Borrows the session, which has been started.
    explicit Player(Session& session);

    // Reloads changed kernels, then evaluates and draws a frame at the current time. If a changed
    // kernel does not build, prints the error and keeps the previous kernel.
    [[nodiscard]] Status renderFrame();
    // Copies the picture to the framebuffer with this name and size in pixels, and draws the
    // overlay. `pixelRatio` is the number of framebuffer pixels per device-independent pixel.
    void showIn(unsigned framebuffer, const QSize& framebufferSize, double pixelRatio);
    // Performs the action of a key, except kQuit, which is the window's.
    void act(Action action);
    // Toggles the deformer at this index of the chain.
    void toggleDeformer(std::size_t index);

    [[nodiscard]] Session& session() noexcept { return fSession; }

private:
    void reloadChangedKernels();
    OverlayTexts texts() const;

    Session& fSession;
    PlayClock fClock;
    FrameRate fFrameRate;
    KernelWatcher fKernelWatcher;
    std::map<std::string, std::string> fBuildErrors; // by the name of the kernel file
    Overlay fOverlay;
    bool fShowsOverlay = true;
    QElapsedTimer fSinceTexts; // invalid if the texts are out of date
};

} // namespace viewer
