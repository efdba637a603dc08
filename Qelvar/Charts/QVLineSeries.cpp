#include "Qelvar/Charts/QVLineSeries.h"

#include <cmath>

#include "Qelvar/Charts/QVChartDrawing.h"
#include "Qelvar/Models/Data/QVChartDataSet.h"

namespace {

constexpr double kDashOn = 3;
constexpr double kDashOff = 5;

bool hasYValue(const QVChartPoint& point) {
    return !point.allYValues().empty();
}

QPainterPath regionPath(const std::vector<QRectF>& regions) {
    QPainterPath path;
    path.setFillRule(Qt::WindingFill);
    for (const QRectF& region : regions) path.addRect(region);
    return path;
}

void addSquareWave(QPainterPath& path, const std::vector<QPointF>& points) {
    path.moveTo(points.front());
    for (size_t i = 1; i < points.size(); ++i) {
        path.lineTo(points[i].x(), points[i - 1].y());
        path.lineTo(points[i]);
    }
}

/// Straight near the middle of each segment, and a curve around each inner point.
void addSineWave(QPainterPath& path, const std::vector<QPointF>& points, double factor) {
    path.moveTo(points.front());
    for (size_t i = 1; i + 1 < points.size(); ++i) {
        const QPointF point = points[i];
        path.lineTo(point - (point - points[i - 1]) * factor);
        path.quadTo(point, point + (points[i + 1] - point) * factor);
    }
    path.lineTo(points.back());
}

}  // namespace

void QVLineSeries::prepareForRendering(QSizeF size, std::optional<VSDate> minXValue,
                                       std::optional<VSDate> maxXValue, std::optional<double> minYValue,
                                       std::optional<double> maxYValue, const QVEdgeInsets& insets,
                                       std::shared_ptr<const QVChartDataSet> dataSet) {
    QVChartSeries::prepareForRendering(size, minXValue, maxXValue, minYValue, maxYValue, insets,
                                       std::move(dataSet));
    dataPoints_.clear();
    for (const auto& chartPoint : this->dataSet()->allDataPoints()) {
        if (!hasYValue(*chartPoint)) continue;
        const QPointF point = pointFromChartPoint(*chartPoint);
        if (std::isfinite(point.y())) dataPoints_.push_back(point);
    }
    regions_ = findRegions();
}

void QVLineSeries::discardPreparation() {
    QVChartSeries::discardPreparation();
    regions_ = {};
}

/// Walks the points, those without a value too, in two states. A run ends, and the next begins, at the same
/// point.
QVLineSeries::Regions QVLineSeries::findRegions() const {
    Regions regions;
    bool connected = false;
    std::vector<double> run;  // the x of its points
    const auto report = [&] {
        if (run.size() >= 2) {
            const QRectF region(run.front(), 0, run.back() - run.front(), imageSize().height());
            (connected ? regions.connected : regions.gaps).push_back(region);
        }
    };
    const auto& points = dataSet()->allDataPoints();
    for (size_t i = 0; i < points.size(); ++i) {
        const double x = xForChartPoint(*points[i]);
        const bool valued = hasYValue(*points[i]);
        const bool nextValued = i + 1 < points.size() && hasYValue(*points[i + 1]);
        run.push_back(x);
        if (connected != (valued && nextValued)) {
            report();
            run = {x};
            connected = !connected;
        }
    }
    report();
    return regions;
}

QPainterPath QVLineSeries::linePath(bool closed) const {
    QPainterPath path;
    path.setFillRule(Qt::WindingFill);
    if (dataPoints_.empty()) return path;
    switch (waveForm_) {
        case WaveForm::Sine:
            addSineWave(path, dataPoints_, sineWaveSmoothingFactor_);
            break;
        case WaveForm::SawTooth:
            path.moveTo(dataPoints_.front());
            for (size_t i = 1; i < dataPoints_.size(); ++i) {
                // Each segment of the line starts anew, so that dashes start at every point.
                if (!closed) path.moveTo(dataPoints_[i - 1]);
                path.lineTo(dataPoints_[i]);
            }
            break;
        case WaveForm::Square:
            addSquareWave(path, dataPoints_);
            break;
    }
    return path;
}

QPainterPath QVLineSeries::fillPath() const {
    QPainterPath path = linePath(true);
    if (path.isEmpty()) return path;
    path.lineTo(dataPoints_.back().x(), imageSize().height());
    path.lineTo(dataPoints_.front().x(), imageSize().height());
    path.closeSubpath();
    return path;
}

QPainterPath QVLineSeries::markerHoles() const {
    QPainterPath path;
    path.setFillRule(Qt::OddEvenFill);
    if (pointRadius_ > 0)
        for (const QPointF& point : dataPoints_) path.addEllipse(point, pointRadius_, pointRadius_);
    return path;
}

void QVLineSeries::strokeLine(QPainter& painter, const std::vector<QRectF>& regions, bool dashed) const {
    if (regions.empty() || lineWidth_ <= 0) return;
    QPen pen(lineColor_, lineWidth_, Qt::SolidLine, Qt::FlatCap, Qt::SvgMiterJoin);
    pen.setMiterLimit(10);
    if (dashed) pen.setDashPattern({kDashOn / lineWidth_, kDashOff / lineWidth_});
    painter.save();
    painter.setClipPath(regionPath(regions), Qt::IntersectClip);
    painter.strokePath(linePath(false), pen);
    painter.restore();
}

void QVLineSeries::renderChart(QPainter& painter) const {
    if (lineColor_.isValid() && (!regions_.connected.empty() || !regions_.gaps.empty())) {
        QVPaintWithHoles(painter, imageSize(), markerHoles(), [this](QPainter& layer) {
            strokeLine(layer, regions_.connected, false);
            strokeLine(layer, regions_.gaps, true);
        });
    }
    if (pointStyle_ == QVPointStyle::None || dataPoints_.empty()) return;
    const QImage marker = QVChartSeriesPointMarker::chartPointWithColor(
        pointColor_, pointRadius_, pointLineWidth_, pointStyle_, painter.device()->devicePixelRatio());
    for (const QPointF& point : dataPoints_) QVDrawCentered(painter, marker, point);
}

void QVLineSeries::renderGradient(QPainter& painter, const QVGradientObject& gradient,
                                  const std::vector<QRectF>& regions) const {
    if (dataPoints_.size() < 2 || !gradient.isValid() || regions.empty()) return;
    QVPaintWithHoles(painter, imageSize(), markerHoles(), [&](QPainter& layer) {
        layer.save();
        layer.setClipPath(regionPath(regions), Qt::IntersectClip);
        layer.fillPath(fillPath(), gradient.verticalGradient(0, imageSize().height()));
        layer.restore();
    });
}

void QVLineSeries::renderFill(QPainter& painter) const {
    renderGradient(painter, fillGradient_, regions_.connected);
}

void QVLineSeries::renderSecondaryFill(QPainter& painter) const {
    renderGradient(painter, secondaryFillGradient_, regions_.gaps);
}
