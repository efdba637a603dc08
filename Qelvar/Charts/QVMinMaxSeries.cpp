#include "Qelvar/Charts/QVMinMaxSeries.h"

#include <algorithm>
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
    radius_ = widthHeldApart(2 * pointRadius_) / 2;
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
    return std::abs(point.absoluteMaxPoint.y() - point.absoluteMinPoint.y()) < 2 * radius_;
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
            chevrons.push_back(chevronShape(position, style, radius_, minimumSide));
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
    QVEraseCircles(layer, circles, radius_);
    layer.setCompositionMode(QPainter::CompositionMode_DestinationOut);
    layer.setPen(Qt::NoPen);
    layer.setBrush(Qt::black);
    for (const QPolygonF& chevron : chevrons) layer.drawPolygon(chevron, Qt::WindingFill);
}

QVLineCapStyle QVMinMaxSeries::barCaps() const {
    // Round ends are where a style has no marker: nothing is kept free then.
    const bool roundCaps = minPointStyle_ == QVPointStyle::None || maxPointStyle_ == QVPointStyle::None;
    return roundCaps ? QVLineCapStyle::Round : QVLineCapStyle::Butt;
}

template <typename Draw>
void QVMinMaxSeries::forEachBar(Draw draw) const {
    const QPointF minGap(0, isChevron(minPointStyle_) ? kChevronGap : 0);
    const QPointF maxGap(0, isChevron(maxPointStyle_) ? kChevronGap : 0);
    for (const ChartPoint& point : chartPoints_)
        if (!isCenterPoint(point)) draw(point.absoluteMinPoint + minGap, point.absoluteMaxPoint - maxGap);
}

void QVMinMaxSeries::renderFill(QPainter& painter) const {
    QVPaintLayer(painter, imageSize(), fillColor_.alphaF(), [&](QPainter& layer) {
        forEachBar([&](QPointF min, QPointF max) {
            QVFillSegment(layer, min, max, 2 * radius_, barCaps(), QVOpaque(fillColor_));
        });
        if (barCaps() == QVLineCapStyle::Butt) eraseMarkerShapes(layer);
    });
}

/// Between the markers, which are the edge of the ends.
void QVMinMaxSeries::renderEdges(QPainter& painter) const {
    std::vector<QRectF> outlines;
    forEachBar([&](QPointF min, QPointF max) {
        outlines.push_back(QVSegmentOutline(painter, min, max, 2 * radius_, barCaps()));
    });
    if (barCaps() == QVLineCapStyle::Round)
        QVDrawEdges(painter, imageSize(), outlines, edgeColor());
    else
        QVDrawSideEdges(painter, outlines, edgeColor());
}

void QVMinMaxSeries::renderChart(QPainter& painter) const {
    if (edgeColor().isValid()) renderEdges(painter);
    if (minPointStyle_ == QVPointStyle::None && maxPointStyle_ == QVPointStyle::None) return;
    const auto marker = [&](QVPointStyle style) {
        return QVChartSeriesPointMarker::chartPointWithColor(pointColor_, radius_,
                                                             std::min(pointLineWidth_, radius_ / 2), style,
                                                             painter.device()->devicePixelRatio());
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
