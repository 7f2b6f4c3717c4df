#include "viewer/overlay/TextPanel.h"

#include <algorithm>

#include <QFontDatabase>
#include <QFontMetrics>
#include <QImage>
#include <QPainter>

namespace viewer {
namespace {

const QColor kBackground(12, 14, 18, 175);
const QColor kTextColour(236, 238, 242);
// Font size and border, relative to the height of a line.
constexpr double kLetterHeight = 0.75;
constexpr double kBorder = 0.6;

QImage rasterised(const QString& text, int lineHeight)
{
    QFont font = QFontDatabase::systemFont(QFontDatabase::FixedFont);
    font.setPixelSize(std::max(1, static_cast<int>(kLetterHeight * lineHeight)));
    const int border = static_cast<int>(kBorder * lineHeight);
    const QSize area = QFontMetrics(font).size(0, text);

    QImage image(area + QSize(2 * border, 2 * border), QImage::Format_ARGB32_Premultiplied);
    image.fill(kBackground);
    QPainter painter(&image);
    painter.setFont(font);
    painter.setPen(kTextColour);
    painter.drawText(QRect(QPoint(border, border), area), Qt::AlignLeft | Qt::AlignTop, text);
    return image;
}

} // namespace

void TextPanel::setText(const std::string& text, int lineHeight)
{
    if (text == fText && lineHeight == fLineHeight)
        return;
    fText = text;
    fLineHeight = lineHeight;
    fTexture.reset();
    const QString shown = QString::fromStdString(text).trimmed();
    if (shown.isEmpty())
        return;
    fTexture = std::make_unique<QOpenGLTexture>(rasterised(shown, lineHeight),
                                                QOpenGLTexture::DontGenerateMipMaps);
    fTexture->setMinMagFilters(QOpenGLTexture::Nearest, QOpenGLTexture::Nearest);
}

void TextPanel::draw(QOpenGLTextureBlitter& blitter, const QPoint& corner, const QSize& framebuffer)
{
    if (!fTexture)
        return;
    const QMatrix4x4 target =
        QOpenGLTextureBlitter::targetTransform(QRect(corner, size()), QRect(QPoint(), framebuffer));
    blitter.blit(fTexture->textureId(), target, QOpenGLTextureBlitter::OriginTopLeft);
}

} // namespace viewer
