#include "Qelvar/Charts/QVChartDrawing.h"

#include <QFontMetricsF>
#include <cmath>

void QVAddSegment(QPainterPath& path, QPointF a, QPointF b, double width, QVLineCapStyle cap) {
    const double half = width / 2;
    const QRectF core = QRectF(a, b).normalized();
    const bool vertical = a.x() == b.x();
    const double reach = cap == QVLineCapStyle::Butt ? 0 : half;
    const QRectF outline =
        vertical ? core.adjusted(-half, -reach, half, reach) : core.adjusted(-reach, -half, reach, half);
    if (outline.isEmpty()) return;
    if (cap == QVLineCapStyle::Round)
        path.addRoundedRect(outline, half, half);
    else
        path.addRect(outline);
}

QImage QVTransparentImage(QSizeF size, double scale) {
    QImage image(static_cast<int>(std::ceil(size.width() * scale)),
                 static_cast<int>(std::ceil(size.height() * scale)), QImage::Format_ARGB32_Premultiplied);
    image.setDevicePixelRatio(scale);
    image.fill(Qt::transparent);
    return image;
}

void QVPaintWithHoles(QPainter& painter, QSizeF imageSize, const QPainterPath& holes,
                      const std::function<void(QPainter&)>& draw) {
    if (holes.isEmpty()) {
        draw(painter);
        return;
    }
    QImage layer = QVTransparentImage(imageSize, painter.device()->devicePixelRatio());
    QPainter layerPainter(&layer);
    layerPainter.setRenderHints(painter.renderHints());
    draw(layerPainter);
    layerPainter.setCompositionMode(QPainter::CompositionMode_DestinationOut);
    layerPainter.setClipping(false);
    layerPainter.fillPath(holes, Qt::black);
    layerPainter.end();
    painter.drawImage(QPointF(0, 0), layer);
}

void QVDrawText(QPainter& painter, QPointF topLeft, const QString& text) {
    painter.drawText(QPointF(topLeft.x(), topLeft.y() + QFontMetricsF(painter.font()).ascent()), text);
}

void QVDrawCentered(QPainter& painter, const QImage& image, QPointF center) {
    if (image.isNull()) return;
    const QSizeF size = image.deviceIndependentSize();
    painter.drawImage(QPointF(center.x() - size.width() / 2, center.y() - size.height() / 2), image);
}
