// What the playing window shows over the picture.
#pragma once

#include "viewer/overlay/TextPanel.h"

#include <string>

#include <QOpenGLTextureBlitter>
#include <QSize>

namespace viewer {

struct OverlayTexts {
    std::string facts;   // upper left
    std::string problem; // lower left
    // Of the two halves of a split picture, at their lower ends.
    std::string leftHalf;
    std::string rightHalf;
};

// Texts are drawn when they change, and cost the blending of a few rectangles in the frames
// between. All operations, and the destruction, need the window's context to be current.
class Overlay {
public:
    Overlay();
    ~Overlay();
    Overlay(const Overlay&) = delete;
    Overlay& operator=(const Overlay&) = delete;

    // `pixelRatio` is the number of the framebuffer's pixels in one of the screen's.
    void setTexts(const OverlayTexts& texts, double pixelRatio);
    // Into the framebuffer that is bound, which has this size in pixels.
    void draw(const QSize& framebuffer);

private:
    void drawPanels(const QSize& framebuffer);

    QOpenGLTextureBlitter fBlitter;
    TextPanel fFacts;
    TextPanel fProblem;
    TextPanel fLeftHalf;
    TextPanel fRightHalf;
};

} // namespace viewer
