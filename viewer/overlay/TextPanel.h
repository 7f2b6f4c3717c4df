// Text on a dark, translucent ground, for the window.
#pragma once

#include <memory>
#include <string>

#include <QOpenGLTexture>
#include <QOpenGLTextureBlitter>
#include <QPoint>
#include <QSize>

namespace viewer {

// Is drawn by the CPU when its text changes, and is a texture from then on. All operations, and the
// destruction, need the context to be current.
class TextPanel {
public:
    // `lineHeight` in pixels.
    void setText(const std::string& text, int lineHeight);

    // In pixels; empty without a text.
    QSize size() const { return fTexture ? QSize(fTexture->width(), fTexture->height()) : QSize(); }
    // `corner` is where its upper left corner goes, in pixels from the framebuffer's. The blitter
    // is bound, and blending is on.
    void draw(QOpenGLTextureBlitter& blitter, const QPoint& corner, const QSize& framebuffer);

private:
    std::string fText;
    int fLineHeight = 0;
    std::unique_ptr<QOpenGLTexture> fTexture; // null without a text
};

} // namespace viewer
