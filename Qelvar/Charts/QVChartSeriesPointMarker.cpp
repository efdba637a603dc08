#include "Qelvar/Charts/QVChartSeriesPointMarker.h"

#include <QGuiApplication>
#include <QPainter>
#include <QScreen>
#include <algorithm>
#include <cmath>

#include "Platform/TextScale.h"

namespace {

/// An open angle pointing down in a square of side `side`, held off its edges by half the line and by a
/// margin.
QPolygonF downwardChevron(double side, double lineWidth) {
    const double margin = 0.15 * side;
    return {QPointF(lineWidth / 2, margin + lineWidth / 2), QPointF(side / 2, side - lineWidth / 2 - margin),
            QPointF(side - lineWidth / 2, margin + lineWidth / 2)};
}

QPolygonF upsideDown(QPolygonF polygon, double side) {
    for (QPointF& point : polygon) point.setY(side - point.y());
    return polygon;
}

}  // namespace

QImage QVChartSeriesPointMarker::chartPointWithColor(const QColor& color, double radius, double lineWidth,
                                                     QVPointStyle style, double scale) {
    const double side = 2 * radius;
    const int pixels = static_cast<int>(std::ceil(side * scale));
    if (style == QVPointStyle::None || pixels <= 0) return {};
    QImage image(pixels, pixels, QImage::Format_ARGB32_Premultiplied);
    image.setDevicePixelRatio(scale);
    image.fill(Qt::transparent);

    QPainter painter(&image);
    painter.setRenderHint(QPainter::Antialiasing);
    const QPen pen(color, lineWidth, Qt::SolidLine, Qt::RoundCap, Qt::RoundJoin);
    const QRectF square(0, 0, side, side);
    if (style == QVPointStyle::Disc) {
        painter.setPen(Qt::NoPen);
        painter.setBrush(color);
        painter.drawEllipse(square);
    } else if (style == QVPointStyle::Ring) {
        painter.setPen(pen);
        painter.drawEllipse(square.adjusted(lineWidth / 2, lineWidth / 2, -lineWidth / 2, -lineWidth / 2));
    } else {
        const QPolygonF chevron = downwardChevron(side, lineWidth);
        painter.setPen(pen);
        painter.drawPolyline(style == QVPointStyle::DownwardChevron ? chevron : upsideDown(chevron, side));
    }
    return image;
}

QImage QVChartSeriesPointMarker::chartPointForText(const QColor& color, double radius, double lineWidth,
                                                   QVPointStyle style) {
    double pixels = 2;
    for (const QScreen* screen : QGuiApplication::screens())
        pixels = std::max(pixels, screen->devicePixelRatio());
    const double scale = platform::textScale();
    return chartPointWithColor(color, radius * scale, lineWidth * scale, style, pixels);
}
