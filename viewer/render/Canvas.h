// Framebuffer that the renderer draws into.
#pragma once

#include <memory>

#include <QImage>
#include <QOpenGLFramebufferObject>
#include <QSize>

namespace viewer {

// Multisampled framebuffer. The OpenGL context must be current in all operations and the
// destructor.
class Canvas {
public:
    // `size` is in pixels.
    explicit Canvas(const QSize& size);

    [[nodiscard]] QSize size() const { return fSamples->size(); }
    void bind() { fSamples->bind(); }
    [[nodiscard]] QImage image() const { return fSamples->toImage(); }
    // Copies the picture to the framebuffer with the name `framebuffer`, scaled to its size in
    // pixels.
    void showIn(GLuint framebuffer, const QSize& framebufferSize);

private:
    std::unique_ptr<QOpenGLFramebufferObject> fSamples;
    std::unique_ptr<QOpenGLFramebufferObject> fResolved;
};

} // namespace viewer
