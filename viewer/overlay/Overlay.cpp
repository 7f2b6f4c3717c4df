#include "viewer/overlay/Overlay.h"

#include <QOpenGLContext>
#include <QOpenGLFunctions>

namespace viewer {
namespace {

constexpr double kLineHeight = 18; // pixels of the screen
constexpr int kMargin = 12;        // pixels between a panel and the edge

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
    fFacts.setText(texts.facts, lineHeight);
    fProblem.setText(texts.problem, lineHeight);
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
    fFacts.draw(fBlitter, {kMargin, kMargin}, framebuffer);
    fProblem.draw(fBlitter, {kMargin, above(fProblem)}, framebuffer);
}

} // namespace viewer
