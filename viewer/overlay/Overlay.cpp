#include "viewer/overlay/Overlay.h"

#include <QOpenGLContext>
#include <QOpenGLFunctions>

namespace viewer {
namespace {

constexpr double kLineHeight = 18; // device-independent pixels
constexpr int kMargin = 12;        // framebuffer pixels between a panel and the edge

} // namespace

Overlay::Overlay()
{
    fBlitter.create();
}

Overlay::~Overlay()
{
    fBlitter.destroy();
}

void Overlay::setTexts(const OverlayTexts& texts, double pixelRatio)
{
    const int lineHeight = static_cast<int>(kLineHeight * pixelRatio);
    fStatistics.setText(texts.statistics, lineHeight);
    fError.setText(texts.error, lineHeight);
    fLeftHalf.setText(texts.leftHalf, lineHeight);
    fRightHalf.setText(texts.rightHalf, lineHeight);
}

void Overlay::draw(const QSize& framebuffer)
{
    QOpenGLFunctions* gl = QOpenGLContext::currentContext()->functions();
    gl->glViewport(0, 0, framebuffer.width(), framebuffer.height());
    gl->glDisable(GL_DEPTH_TEST);
    gl->glEnable(GL_BLEND);
    gl->glBlendFunc(GL_SRC_ALPHA, GL_ONE_MINUS_SRC_ALPHA);
    fBlitter.bind();
    drawPanels(framebuffer);
    fBlitter.release();
    gl->glDisable(GL_BLEND);
}

void Overlay::drawPanels(const QSize& framebuffer)
{
    const auto above = [&](const TextPanel& panel) {
        return framebuffer.height() - panel.size().height() - kMargin;
    };
    const auto centred = [&](const TextPanel& panel, int quarter) {
        return QPoint(quarter * framebuffer.width() / 4 - panel.size().width() / 2, above(panel));
    };
    fLeftHalf.draw(fBlitter, centred(fLeftHalf, 1), framebuffer);
    fRightHalf.draw(fBlitter, centred(fRightHalf, 3), framebuffer);
    fStatistics.draw(fBlitter, {kMargin, kMargin}, framebuffer);
    fError.draw(fBlitter, {kMargin, above(fError)}, framebuffer);
}

} // namespace viewer
