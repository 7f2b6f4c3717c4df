// The time of what a window plays.
#pragma once

#include <QElapsedTimer>

namespace viewer {

// Runs from its construction on, with pauses.
class PlayClock {
public:
    PlayClock() { fSinceResumed.start(); }

    double seconds() const
    {
        constexpr double kMsPerSecond = 1000.0;
        return static_cast<double>(milliseconds()) / kMsPerSecond;
    }
    bool paused() const { return !fSinceResumed.isValid(); }
    void togglePause()
    {
        fBeforeMs = milliseconds();
        if (paused())
            fSinceResumed.start();
        else
            fSinceResumed.invalidate();
    }

private:
    qint64 milliseconds() const { return fBeforeMs + (paused() ? 0 : fSinceResumed.elapsed()); }

    qint64 fBeforeMs = 0;        // played before it was last resumed, or paused
    QElapsedTimer fSinceResumed; // invalid: paused
};

} // namespace viewer
