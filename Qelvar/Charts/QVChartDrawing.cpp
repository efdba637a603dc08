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

/// The hairlines along both long sides of an outline. They lie on whole pixels: nothing is to be smoothed,
/// which would take several times as long.
void drawSides(QPainter& painter, const QRectF& outline, const QColor& color, Qt::Orientation direction) {
    const double edge = edgeWidth(painter);
    const bool vertical = direction == Qt::Vertical;
    if ((vertical ? outline.width() : outline.height()) <= 2 * edge) {
        painter.fillRect(outline, color);
    } else if (vertical) {
        painter.fillRect(QRectF(outline.left(), outline.top(), edge, outline.height()), color);
        painter.fillRect(QRectF(outline.right() - edge, outline.top(), edge, outline.height()), color);
    } else {
        painter.fillRect(QRectF(outline.left(), outline.top(), outline.width(), edge), color);
        painter.fillRect(QRectF(outline.left(), outline.bottom() - edge, outline.width(), edge), color);
    }
}

/// Runs `draw` without smoothing.
template <typename Draw>
void withoutSmoothing(QPainter& painter, Draw draw) {
    const bool smooth = painter.testRenderHint(QPainter::Antialiasing);
    painter.setRenderHint(QPainter::Antialiasing, false);
    draw();
    painter.setRenderHint(QPainter::Antialiasing, smooth);
}

/// The edge of a dot of so many pixels.
QImage ringImage(int side, int edge, const QColor& color) {
    QImage image(side, side, QImage::Format_ARGB32_Premultiplied);
    image.fill(Qt::transparent);
    QPainter painter(&image);
    painter.setRenderHint(QPainter::Antialiasing);
    QPainterPath path = rounded(QRectF(0, 0, side, side));
    if (side > 2 * edge) path.addPath(rounded(QRectF(edge, edge, side - 2 * edge, side - 2 * edge)));
    painter.fillPath(path, color);  // odd-even
    return image;
}

/// The edge of a rounded outline: the halves of a dot's, which is made once for all that are as thick, and
/// the sides between them.
void drawEdge(QPainter& painter, const QRectF& outline, const QColor& color, QImage& ring) {
    const double pixels = painter.device()->devicePixelRatio();
    const double thickness = std::min(outline.width(), outline.height());
    const int side = static_cast<int>(std::lround(thickness * pixels));
    if (side <= 0) return;
    if (ring.width() != side)
        ring = ringImage(side, static_cast<int>(std::lround(edgeWidth(painter) * pixels)), color);
    const bool vertical = outline.height() >= outline.width();
    const int first = side / 2, last = side - first;
    const auto drawHalf = [&](QPointF place, int from, int length) {
        const QRect part = vertical ? QRect(0, from, side, length) : QRect(from, 0, length, side);
        painter.drawImage(QRectF(place, QSizeF(part.size()) / pixels), ring, part);
    };
    const double firstEnd = first / pixels, lastStart = last / pixels;
    drawHalf(outline.topLeft(), 0, first);
    if (vertical) {
        drawHalf({outline.left(), outline.bottom() - lastStart}, first, last);
        drawSides(painter, outline.adjusted(0, firstEnd, 0, -lastStart), color, Qt::Vertical);
    } else {
        drawHalf({outline.right() - lastStart, outline.top()}, first, last);
        drawSides(painter, outline.adjusted(firstEnd, 0, -lastStart, 0), color, Qt::Horizontal);
    }
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
    if (!overlap(outlines)) {
        QImage ring;
        withoutSmoothing(painter, [&] {
            for (const QRectF& outline : outlines) drawEdge(painter, outline, color, ring);
        });
        return;
    }
    const double edge = edgeWidth(painter);
    const auto inside = [edge](const QRectF& outline) { return outline.adjusted(edge, edge, -edge, -edge); };
    QVPaintLayer(painter, imageSize, color.alphaF(), [&](QPainter& layer) {
        for (const QRectF& outline : outlines) layer.fillPath(rounded(outline), QVOpaque(color));
        layer.setCompositionMode(QPainter::CompositionMode_DestinationOut);
        for (const QRectF& outline : outlines)
            if (!inside(outline).isEmpty()) layer.fillPath(rounded(inside(outline)), Qt::black);
    });
}

void QVDrawSideEdges(QPainter& painter, const std::vector<QRectF>& outlines, const QColor& color) {
    withoutSmoothing(painter, [&] {
        for (const QRectF& outline : outlines) drawSides(painter, outline, color, Qt::Vertical);
    });
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
