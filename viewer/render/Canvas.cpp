#include "viewer/render/Canvas.h"

#include <QOpenGLContext>
#include <QOpenGLExtraFunctions>

namespace viewer {
namespace {

constexpr int kSamplesPerPixel = 4;

} // namespace

Canvas::Canvas(const QSize& size)
{
    QOpenGLFramebufferObjectFormat format;
    format.setAttachment(QOpenGLFramebufferObject::Depth);
    format.setSamples(kSamplesPerPixel);
    fSamples = std::make_unique<QOpenGLFramebufferObject>(size, format);
    fResolved = std::make_unique<QOpenGLFramebufferObject>(size);
}

void Canvas::showIn(GLuint framebuffer, const QSize& framebufferSize)
{
    // Resolving samples requires the same format, and a window's framebuffer may have another.
    QOpenGLFramebufferObject::blitFramebuffer(fResolved.get(), fSamples.get());
    QOpenGLExtraFunctions* gl = QOpenGLContext::currentContext()->extraFunctions();
    gl->glBindFramebuffer(GL_READ_FRAMEBUFFER, fResolved->handle());
    gl->glBindFramebuffer(GL_DRAW_FRAMEBUFFER, framebuffer);
    gl->glBlitFramebuffer(0, 0, size().width(), size().height(), 0, 0, framebufferSize.width(),
                          framebufferSize.height(), GL_COLOR_BUFFER_BIT, GL_LINEAR);
    gl->glBindFramebuffer(GL_FRAMEBUFFER, framebuffer);
}

} // namespace viewer
