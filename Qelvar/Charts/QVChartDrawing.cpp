#include "Qelvar/Charts/QVChartDrawing.h"

#include <QFontMetricsF>
#include <QPainterPath>
#include <cmath>

#include "Qelvar/Charts/QVChartSeriesPointMarker.h"

QImage QVTransparentImage(QSizeF size, double scale) {
    QImage image(static_cast<int>(std::ceil(size.width() * scale)),
                 static_cast<int>(std::ceil(size.height() * scale)), QImage::Format_ARGB32_Premultiplied);
    image.setDevicePixelRatio(scale);
    image.fill(Qt::transparent);
    return image;
}

void QVPaintLayer(QPainter& painter, QSizeF imageSize, double opacity,
                  const std::function<void(QPainter&)>& draw) {
    QImage layer = QVTransparentImage(imageSize, painter.device()->devicePixelRatio());
    QPainter layerPainter(&layer);
    layerPainter.setRenderHints(painter.renderHints());
    draw(layerPainter);
    layerPainter.end();
    painter.save();
    painter.setOpacity(painter.opacity() * opacity);
    painter.drawImage(QPointF(0, 0), layer);
    painter.restore();
}

void QVFillSegment(QPainter& painter, QPointF a, QPointF b, double width, QVLineCapStyle cap,
                   const QColor& color) {
    const double half = width / 2;
    const double reach = cap == QVLineCapStyle::Butt ? 0 : half;
    const QRectF core = QRectF(a, b).normalized();
    const QRectF outline = a.x() == b.x() ? core.adjusted(-half, -reach, half, reach)
                                          : core.adjusted(-reach, -half, reach, half);
    if (outline.isEmpty()) return;
    if (cap != QVLineCapStyle::Round) {
        painter.fillRect(outline, color);
        return;
    }
    QPainterPath path;
    path.addRoundedRect(outline, half, half);
    painter.fillPath(path, color);
}

void QVEraseCircles(QPainter& painter, const std::vector<QPointF>& centers, double radius) {
    if (centers.empty()) return;
    const QImage disc = QVChartSeriesPointMarker::chartPointWithColor(
        Qt::black, radius, 0, QVPointStyle::Disc, painter.device()->devicePixelRatio());
    painter.save();
    painter.setClipping(false);
    painter.setCompositionMode(QPainter::CompositionMode_DestinationOut);
    for (const QPointF& center : centers) QVDrawCentered(painter, disc, center);
    painter.restore();
}

QColor QVOpaque(QColor color) {
    color.setAlpha(255);
    return color;
}

void QVDrawText(QPainter& painter, QPointF topLeft, const QString& text) {
    painter.drawText(QPointF(topLeft.x(), topLeft.y() + QFontMetricsF(painter.font()).ascent()), text);
}

void QVDrawCentered(QPainter& painter, const QImage& image, QPointF center) {
    if (image.isNull()) return;
    const QSizeF size = image.deviceIndependentSize();
    painter.drawImage(QPointF(center.x() - size.width() / 2, center.y() - size.height() / 2), image);
}
