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

/// The shape of a marker at the lower end of a bar (`minimumSide`) or at its upper end.
void QVMinMaxSeries::addMarkerShape(QPainterPath& path, QPointF position, QVPointStyle style,
                                    bool minimumSide) const {
    if (style == QVPointStyle::None) return;
    if (!isChevron(style)) {
        path.addEllipse(position, pointRadius_, pointRadius_);
        return;
    }
    const double x = position.x();
    const double side = std::round(pointRadius_);
    const double base = minimumSide ? position.y() + kChevronGap : position.y() - kChevronGap;
    const double far = minimumSide ? base - side : base + side;
    const bool triangle = (style == QVPointStyle::DownwardChevron) != minimumSide;
    path.moveTo(x - side, base);
    path.lineTo(x + side, base);
    if (triangle) {
        path.lineTo(x, far);
    } else {
        path.lineTo(x + side, far);
        path.lineTo(x, base);
        path.lineTo(x - side, far);
    }
    path.closeSubpath();
}

QPainterPath QVMinMaxSeries::markerShapes() const {
    QPainterPath path;
    path.setFillRule(Qt::WindingFill);
    if (minPointStyle_ == QVPointStyle::None || maxPointStyle_ == QVPointStyle::None) return path;
    for (const ChartPoint& point : chartPoints_) {
        if (isCenterPoint(point)) {
            addMarkerShape(path, (point.absoluteMinPoint + point.absoluteMaxPoint) / 2, maxPointStyle_, true);
            continue;
        }
        if (!point.minIsClamped) addMarkerShape(path, point.absoluteMinPoint, minPointStyle_, true);
        if (!point.maxIsClamped) addMarkerShape(path, point.absoluteMaxPoint, maxPointStyle_, false);
    }
    return path;
}

void QVMinMaxSeries::renderFill(QPainter& painter) const {
    const bool roundCaps = minPointStyle_ == QVPointStyle::None || maxPointStyle_ == QVPointStyle::None;
    const double minGap = isChevron(minPointStyle_) ? kChevronGap : 0;
    const double maxGap = isChevron(maxPointStyle_) ? kChevronGap : 0;
    QPainterPath bars;
    bars.setFillRule(Qt::WindingFill);
    for (const ChartPoint& point : chartPoints_) {
        if (isCenterPoint(point)) continue;
        QVAddSegment(bars, point.absoluteMinPoint + QPointF(0, minGap),
                     point.absoluteMaxPoint - QPointF(0, maxGap), 2 * pointRadius_,
                     roundCaps ? QVLineCapStyle::Round : QVLineCapStyle::Butt);
    }
    QVPaintWithHoles(painter, imageSize(), markerShapes(),
                     [&](QPainter& layer) { layer.fillPath(bars, fillColor_); });
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
