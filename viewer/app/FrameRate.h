// Frames per second of what a window plays.
#pragma once

#include <QElapsedTimer>

namespace viewer {

// Measures over periods of about half a second.
class FrameRate {
public:
    FrameRate() { fSincePeriod.start(); }

    // To be called once for each frame.
    void countFrame()
    {
        constexpr qint64 kPeriod = 500; // ms: steady enough to be read
        constexpr double kMsPerSecond = 1000.0;
        fFrames += 1;
        if (fSincePeriod.elapsed() < kPeriod)
            return;
        fPerSecond = fFrames * kMsPerSecond / static_cast<double>(fSincePeriod.restart());
        fFrames = 0;
    }

    // Of the last whole period; 0 in the first.
    double perSecond() const { return fPerSecond; }

private:
    QElapsedTimer fSincePeriod;
    int fFrames = 0;
    double fPerSecond = 0;
};

} // namespace viewer
