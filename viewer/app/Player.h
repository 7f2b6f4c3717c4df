// What a window that plays adds to a session: a clock that can be paused, keys, the overlay, and
// kernels that are changed meanwhile.
#pragma once

#include "viewer/Failure.h"
#include "viewer/app/Controls.h"
#include "viewer/app/FrameRate.h"
#include "viewer/app/KernelWatch.h"
#include "viewer/app/PlayClock.h"
#include "viewer/overlay/Overlay.h"

#include <cstddef>
#include <map>
#include <string>

#include <QElapsedTimer>

namespace viewer {

class Session;

// All operations, and the destruction, need the window's context to be current.
class Player {
public:
    // Borrows the session, which is started.
    explicit Player(Session& session);

    // Takes over changed kernels, then evaluates and draws a frame of the present time.
    Status renderFrame();
    // Fills the framebuffer of this name and size with the picture and the overlay. `pixelRatio` is
    // the number of its pixels in one of the screen's.
    void showIn(unsigned framebuffer, const QSize& framebufferSize, double pixelRatio);
    // Does what a key asks for. To quit is the window's.
    void act(Action action);
    // Switches one deformer of the chain.
    void toggleDeformer(std::size_t number);

    Session& session() { return fSession; }

private:
    void takeChangedKernels();
    OverlayTexts texts() const;

    Session& fSession;
    PlayClock fClock;
    FrameRate fFrameRate;
    KernelWatch fKernelWatch;
    std::map<std::string, std::string> fComplaints; // by the kernel file
    Overlay fOverlay;
    bool fShowsOverlay = true;
    QElapsedTimer fSinceTexts; // invalid: the texts are out of date
};

} // namespace viewer
