// Text on a dark, translucent background.
#pragma once

#include <memory>
#include <string>

#include <QOpenGLTexture>
#include <QOpenGLTextureBlitter>
#include <QPoint>
#include <QSize>

namespace viewer {

// Texture that the CPU rasterises when the text changes. The OpenGL context must be current in all
// operations and the destructor.
class TextPanel {
public:
    // `lineHeight` is in pixels. An empty text makes the panel invisible.
    void setText(const std::string& text, int lineHeight);

    // Returns the size in pixels, empty without a text.
    [[nodiscard]] QSize size() const
    {
        return fTexture ? QSize(fTexture->width(), fTexture->height()) : QSize();
    }
    // Draws into a framebuffer of the size `framebuffer`. `corner` is the upper left corner of the
    // panel in pixels. The blitter must be bound, and blending enabled.
    void draw(QOpenGLTextureBlitter& blitter, const QPoint& corner, const QSize& framebuffer);

private:
    std::string fText;
    int fLineHeight = 0;
    std::unique_ptr<QOpenGLTexture> fTexture; // null without a text
};

} // namespace viewer
