// Texts over the picture.
#pragma once

#include "viewer/overlay/TextPanel.h"

#include <string>

#include <QOpenGLTextureBlitter>
#include <QSize>

namespace viewer {

struct OverlayTexts {
    std::string statistics; // upper left
    std::string error;      // lower left
    // At the lower ends of both halves of a split picture.
    std::string leftHalf;
    std::string rightHalf;
};

// Texts are rasterised when they change; each frame only blends a few rectangles. The OpenGL
// context must be current in all operations, the constructor and the destructor.
class Overlay {
public:
    Overlay();
    ~Overlay();
    Overlay(const Overlay&) = delete;
    Overlay& operator=(const Overlay&) = delete;

    // `pixelRatio` is the number of framebuffer pixels per device-independent pixel.
    void setTexts(const OverlayTexts& texts, double pixelRatio);
    // Draws into the bound framebuffer, which has this size in pixels.
    void draw(const QSize& framebuffer);

private:
    void drawPanels(const QSize& framebuffer);

    QOpenGLTextureBlitter fBlitter;
    TextPanel fStatistics;
    TextPanel fError;
    TextPanel fLeftHalf;
    TextPanel fRightHalf;
};

} // namespace viewer
