#include "Qelvar/Charts/QVChartDrawing.h"

#include <QFontMetricsF>
#include <QPainterPath>
#include <algorithm>
#include <cmath>

#include "Qelvar/Charts/QVChartSeriesPointMarker.h"

namespace {

/// Of a hairline along a shape, in points, where pixels are fine enough.
constexpr double kEdgeWidth = 0.75;
/// More outlines are not looked at one by one.
constexpr size_t kManyOutlines = 64;

/// Whole pixels, at least one.
double edgeWidth(const QPainter& painter) {
    const double pixels = painter.device()->devicePixelRatio();
    return std::max(1.0, std::round(kEdgeWidth * pixels)) / pixels;
}

QPainterPath rounded(const QRectF& outline) {
    const double radius = std::min(outline.width(), outline.height()) / 2;
    QPainterPath path;
    path.addRoundedRect(outline, radius, radius);
    return path;
}

bool overlap(const std::vector<QRectF>& outlines) {
    if (outlines.size() > kManyOutlines) return true;
    for (size_t i = 1; i < outlines.size(); ++i)
        for (size_t j = 0; j < i; ++j)
            if (outlines[i].intersects(outlines[j])) return true;
    return false;
}

}  // namespace

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

QRectF QVSegmentOutline(const QPainter& painter, QPointF a, QPointF b, double width, QVLineCapStyle cap) {
    const double pixels = painter.device()->devicePixelRatio();
    const double half = width / 2;
    const double reach = cap == QVLineCapStyle::Butt ? 0 : half;
    const QRectF core = QRectF(a, b).normalized();
    const QRectF outline = a.x() == b.x() ? core.adjusted(-half, -reach, half, reach)
                                          : core.adjusted(-reach, -half, reach, half);
    if (outline.isEmpty()) return {};
    const auto onGrid = [pixels](double value) { return std::round(value * pixels) / pixels; };
    const auto whole = [&](double length) { return std::max(1 / pixels, onGrid(length)); };
    return {onGrid(outline.x()), onGrid(outline.y()), whole(outline.width()), whole(outline.height())};
}

void QVFillSegment(QPainter& painter, QPointF a, QPointF b, double width, QVLineCapStyle cap,
                   const QColor& color) {
    const QRectF outline = QVSegmentOutline(painter, a, b, width, cap);
    if (outline.isEmpty()) return;
    if (cap == QVLineCapStyle::Round)
        painter.fillPath(rounded(outline), color);
    else
        painter.fillRect(outline, color);
}

void QVDrawEdges(QPainter& painter, QSizeF imageSize, const std::vector<QRectF>& outlines,
                 const QColor& color) {
    const double edge = edgeWidth(painter);
    const auto inside = [edge](const QRectF& outline) { return outline.adjusted(edge, edge, -edge, -edge); };
    if (!overlap(outlines)) {
        for (const QRectF& outline : outlines) {
            QPainterPath path = rounded(outline);
            if (!inside(outline).isEmpty()) path.addPath(rounded(inside(outline)));
            painter.fillPath(path, color);  // odd-even
        }
        return;
    }
    QVPaintLayer(painter, imageSize, color.alphaF(), [&](QPainter& layer) {
        for (const QRectF& outline : outlines) layer.fillPath(rounded(outline), QVOpaque(color));
        layer.setCompositionMode(QPainter::CompositionMode_DestinationOut);
        for (const QRectF& outline : outlines)
            if (!inside(outline).isEmpty()) layer.fillPath(rounded(inside(outline)), Qt::black);
    });
}

void QVDrawSideEdges(QPainter& painter, const std::vector<QRectF>& outlines, const QColor& color) {
    const double edge = edgeWidth(painter);
    for (const QRectF& outline : outlines) {
        if (outline.width() <= 2 * edge) {
            painter.fillRect(outline, color);
            continue;
        }
        painter.fillRect(QRectF(outline.left(), outline.top(), edge, outline.height()), color);
        painter.fillRect(QRectF(outline.right() - edge, outline.top(), edge, outline.height()), color);
    }
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
