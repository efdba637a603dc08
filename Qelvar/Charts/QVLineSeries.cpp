#include "Qelvar/Charts/QVLineSeries.h"

#include <algorithm>
#include <cmath>
#include <limits>

#include "Qelvar/Charts/QVChartDrawing.h"
#include "Qelvar/Models/Data/QVChartDataSet.h"

namespace {

constexpr double kDashOn = 3;
constexpr double kDashOff = 5;
/// A smaller marker is not seen.
constexpr double kSmallestRadius = 1;

bool hasYValue(const QVChartPoint& point) {
    return !point.allYValues().empty();
}

/// Whether anything between two x lies in the region.
bool touches(const QRectF& region, double x1, double x2) {
    return std::max(x1, x2) >= region.left() && std::min(x1, x2) <= region.right();
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
    radius_ = heldApartRadius();
}

/// Readings stand where they were taken: only their nearest neighbours say how much room a marker has.
double QVLineSeries::heldApartRadius() const {
    double pitch = std::numeric_limits<double>::infinity();
    for (size_t i = 1; i < dataPoints_.size(); ++i) {
        const double way = std::abs(dataPoints_[i].x() - dataPoints_[i - 1].x());
        if (way > 0) pitch = std::min(pitch, way);
    }
    return std::max(std::min(pointRadius_, kSmallestRadius), widthHeldApart(2 * pointRadius_, pitch) / 2);
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

/// The way through all points. A saw tooth is drawn segment by segment instead.
QPainterPath QVLineSeries::wavePath() const {
    QPainterPath path;
    if (dataPoints_.empty()) return path;
    if (waveForm_ == WaveForm::Sine) addSineWave(path, dataPoints_, sineWaveSmoothingFactor_);
    if (waveForm_ == WaveForm::Square) addSquareWave(path, dataPoints_);
    return path;
}

void QVLineSeries::strokeLine(QPainter& layer, const std::vector<QRectF>& regions, bool dashed) const {
    QPen pen(QVOpaque(lineColor_), lineWidth_, Qt::SolidLine, Qt::FlatCap, Qt::SvgMiterJoin);
    pen.setMiterLimit(10);
    if (dashed) pen.setDashPattern({kDashOn / lineWidth_, kDashOff / lineWidth_});
    const QPainterPath wave = wavePath();
    layer.save();
    layer.setPen(pen);
    for (const QRectF& region : regions) {
        layer.setClipRect(region);
        layer.strokePath(wave, pen);
        if (waveForm_ != WaveForm::SawTooth) continue;
        // Each segment starts anew, so that dashes start at every point.
        for (size_t i = 1; i < dataPoints_.size(); ++i)
            if (touches(region, dataPoints_[i - 1].x(), dataPoints_[i].x()))
                layer.drawLine(dataPoints_[i - 1], dataPoints_[i]);
    }
    layer.restore();
}

void QVLineSeries::renderChart(QPainter& painter) const {
    if (lineColor_.isValid() && lineWidth_ > 0 && (!regions_.connected.empty() || !regions_.gaps.empty())) {
        QVPaintLayer(painter, imageSize(), lineColor_.alphaF(), [this](QPainter& layer) {
            strokeLine(layer, regions_.connected, false);
            strokeLine(layer, regions_.gaps, true);
            QVEraseCircles(layer, dataPoints_, radius_);
        });
    }
    if (pointStyle_ == QVPointStyle::None || dataPoints_.empty()) return;
    const QImage marker = QVChartSeriesPointMarker::chartPointWithColor(
        pointColor_, radius_, std::min(pointLineWidth_, radius_ / 2), pointStyle_,
        painter.device()->devicePixelRatio());
    for (const QPointF& point : dataPoints_) QVDrawCentered(painter, marker, point);
}

void QVLineSeries::fillBeneath(QPainter& layer, const QRectF& region, const QBrush& brush) const {
    const double bottom = imageSize().height();
    if (waveForm_ != WaveForm::SawTooth) {
        QPainterPath path = wavePath();
        path.setFillRule(Qt::WindingFill);
        path.lineTo(dataPoints_.back().x(), bottom);
        path.lineTo(dataPoints_.front().x(), bottom);
        path.closeSubpath();
        layer.fillPath(path, brush);
        return;
    }
    // Pieces side by side: where they share a pixel their parts of it add up.
    layer.setCompositionMode(QPainter::CompositionMode_Plus);
    layer.setPen(Qt::NoPen);
    layer.setBrush(brush);
    for (size_t i = 1; i < dataPoints_.size(); ++i) {
        const QPointF from = dataPoints_[i - 1], to = dataPoints_[i];
        if (from.x() != to.x() && touches(region, from.x(), to.x()))
            layer.drawPolygon(QPolygonF{from, to, QPointF(to.x(), bottom), QPointF(from.x(), bottom)});
    }
}

bool QVLineSeries::drawsGradient(const QVGradientObject& gradient, const std::vector<QRectF>& regions) const {
    return dataPoints_.size() >= 2 && gradient.isValid() && !regions.empty();
}

void QVLineSeries::renderGradient(QPainter& painter, const QVGradientObject& gradient,
                                  const std::vector<QRectF>& regions) const {
    if (!drawsGradient(gradient, regions)) return;
    QVPaintLayer(painter, imageSize(), 1, [&](QPainter& layer) {
        const QBrush brush(gradient.verticalGradient(0, imageSize().height()));
        for (const QRectF& region : regions) {
            layer.save();
            layer.setClipRect(region);
            fillBeneath(layer, region, brush);
            layer.restore();
        }
        QVEraseCircles(layer, dataPoints_, radius_);
    });
}

void QVLineSeries::renderFill(QPainter& painter) const {
    renderGradient(painter, fillGradient_, regions_.connected);
}

void QVLineSeries::renderSecondaryFill(QPainter& painter) const {
    renderGradient(painter, secondaryFillGradient_, regions_.gaps);
}
