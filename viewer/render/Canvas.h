// The picture that the renderer draws into.
#pragma once

#include <memory>

#include <QImage>
#include <QOpenGLFramebufferObject>
#include <QSize>

namespace viewer {

// An anti-aliased framebuffer. All operations need the context to be current.
class Canvas {
public:
    // `size` in pixels.
    explicit Canvas(const QSize& size);

    QSize size() const { return fSamples->size(); }
    void bind() { fSamples->bind(); }
    QImage image() const { return fSamples->toImage(); }
    // Fills the framebuffer of this name and size with the picture.
    void showIn(GLuint framebuffer, const QSize& framebufferSize);

private:
    std::unique_ptr<QOpenGLFramebufferObject> fSamples;
    std::unique_ptr<QOpenGLFramebufferObject> fResolved;
};

} // namespace viewer
