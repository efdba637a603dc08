#include "Qelvar/Charts/QVMinMaxSeries.h"

#include <cmath>

#include "Qelvar/Charts/QVChartDrawing.h"
#include "Qelvar/Models/Data/QVChartDataSet.h"

namespace {

/// A chevron's bar ends this far inside the marker's centre.
constexpr double kChevronGap = 2;

bool isChevron(QVPointStyle style) {
    return style == QVPointStyle::UpwardChevron || style == QVPointStyle::DownwardChevron;
}

}  // namespace

void QVMinMaxSeries::prepareForRendering(QSizeF size, std::optional<VSDate> minXValue,
                                         std::optional<VSDate> maxXValue, std::optional<double> minYValue,
                                         std::optional<double> maxYValue, const QVEdgeInsets& insets,
                                         std::shared_ptr<const QVChartDataSet> dataSet) {
    QVChartSeries::prepareForRendering(size, minXValue, maxXValue, minYValue, maxYValue, insets,
                                       std::move(dataSet));
    chartPoints_.clear();
    for (const auto& chartPoint : this->dataSet()->allDataPoints()) {
        const std::optional<double> min = chartPoint->yValueForKey("min");
        const std::optional<double> max = chartPoint->yValueForKey("max");
        const double x = xForChartPoint(*chartPoint);
        const ChartPoint point{
            {x, yForValue(min)}, {x, yForValue(max)}, yValueIsClamped(min), yValueIsClamped(max)};
        if (std::isfinite(point.absoluteMinPoint.y()) && std::isfinite(point.absoluteMaxPoint.y()))
            chartPoints_.push_back(point);
    }
}

void QVMinMaxSeries::discardPreparation() {
    QVChartSeries::discardPreparation();
    chartPoints_.clear();
}

bool QVMinMaxSeries::isCenterPoint(const ChartPoint& point) const {
    return std::abs(point.absoluteMaxPoint.y() - point.absoluteMinPoint.y()) < 2 * pointRadius_;
}

namespace {

/// The shape of a chevron at the lower end of a bar (`minimumSide`) or at its upper end.
QPolygonF chevronShape(QPointF position, QVPointStyle style, double radius, bool minimumSide) {
    const double x = position.x();
    const double side = std::round(radius);
    const double base = minimumSide ? position.y() + kChevronGap : position.y() - kChevronGap;
    const double far = minimumSide ? base - side : base + side;
    const bool triangle = (style == QVPointStyle::DownwardChevron) != minimumSide;
    if (triangle) return {QPointF(x - side, base), QPointF(x + side, base), QPointF(x, far)};
    return {QPointF(x - side, base), QPointF(x + side, base), QPointF(x + side, far), QPointF(x, base),
            QPointF(x - side, far)};
}

}  // namespace

/// Clears the places of the markers.
void QVMinMaxSeries::eraseMarkerShapes(QPainter& layer) const {
    std::vector<QPointF> circles;
    std::vector<QPolygonF> chevrons;
    const auto add = [&](QPointF position, QVPointStyle style, bool minimumSide) {
        if (isChevron(style))
            chevrons.push_back(chevronShape(position, style, pointRadius_, minimumSide));
        else
            circles.push_back(position);
    };
    for (const ChartPoint& point : chartPoints_) {
        if (isCenterPoint(point)) {
            add((point.absoluteMinPoint + point.absoluteMaxPoint) / 2, maxPointStyle_, true);
            continue;
        }
        if (!point.minIsClamped) add(point.absoluteMinPoint, minPointStyle_, true);
        if (!point.maxIsClamped) add(point.absoluteMaxPoint, maxPointStyle_, false);
    }
    QVEraseCircles(layer, circles, pointRadius_);
    layer.setCompositionMode(QPainter::CompositionMode_DestinationOut);
    layer.setPen(Qt::NoPen);
    layer.setBrush(Qt::black);
    for (const QPolygonF& chevron : chevrons) layer.drawPolygon(chevron, Qt::WindingFill);
}

void QVMinMaxSeries::renderFill(QPainter& painter) const {
    const bool roundCaps = minPointStyle_ == QVPointStyle::None || maxPointStyle_ == QVPointStyle::None;
    const double minGap = isChevron(minPointStyle_) ? kChevronGap : 0;
    const double maxGap = isChevron(maxPointStyle_) ? kChevronGap : 0;
    QVPaintLayer(painter, imageSize(), fillColor_.alphaF(), [&](QPainter& layer) {
        for (const ChartPoint& point : chartPoints_) {
            if (isCenterPoint(point)) continue;
            QVFillSegment(layer, point.absoluteMinPoint + QPointF(0, minGap),
                          point.absoluteMaxPoint - QPointF(0, maxGap), 2 * pointRadius_,
                          roundCaps ? QVLineCapStyle::Round : QVLineCapStyle::Butt, QVOpaque(fillColor_));
        }
        // Round ends are where a style has no marker: nothing is kept free then.
        if (!roundCaps) eraseMarkerShapes(layer);
    });
}

void QVMinMaxSeries::renderChart(QPainter& painter) const {
    if (minPointStyle_ == QVPointStyle::None && maxPointStyle_ == QVPointStyle::None) return;
    const auto marker = [&](QVPointStyle style) {
        return QVChartSeriesPointMarker::chartPointWithColor(pointColor_, pointRadius_, pointLineWidth_,
                                                             style, painter.device()->devicePixelRatio());
    };
    const QImage maxMarker = marker(maxPointStyle_);
    const QImage clampedMarker = marker(QVPointStyle::UpwardChevron);
    const QImage minMarker = minPointStyle_ == maxPointStyle_ ? maxMarker : marker(minPointStyle_);
    const bool drawsMax = maxPointStyle_ != QVPointStyle::None;
    const bool drawsMin = minPointStyle_ != QVPointStyle::None;
    for (const ChartPoint& point : chartPoints_) {
        const QImage& upper = point.maxIsClamped ? clampedMarker : maxMarker;
        if (isCenterPoint(point)) {
            if (drawsMax)
                QVDrawCentered(painter, upper, (point.absoluteMinPoint + point.absoluteMaxPoint) / 2);
            continue;
        }
        if (drawsMax) QVDrawCentered(painter, upper, point.absoluteMaxPoint);
        if (drawsMin)
            QVDrawCentered(painter, point.minIsClamped ? clampedMarker : minMarker, point.absoluteMinPoint);
    }
}
