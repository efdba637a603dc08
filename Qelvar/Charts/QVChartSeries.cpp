#include "Qelvar/Charts/QVChartSeries.h"

#include <algorithm>
#include <cmath>

#include "Qelvar/Models/Data/QVChartDataSet.h"

namespace {

/// So much of the way from one point to the next is drawn on at most.
constexpr double kDrawnShare = 0.8;

}  // namespace

std::unique_ptr<QVChartSeries> QVChartSeries::copy() const {
    auto result = clone();
    result->discardPreparation();
    return result;
}

void QVChartSeries::discardPreparation() {
    dataPoints_.clear();
    imageSize_ = {};
    insets_ = {};
    minXValue_ = maxXValue_ = std::nullopt;
    minYValue_ = maxYValue_ = std::nullopt;
    dataSet_ = nullptr;
}

void QVChartSeries::prepareForRendering(QSizeF size, std::optional<VSDate> minXValue,
                                        std::optional<VSDate> maxXValue, std::optional<double> minYValue,
                                        std::optional<double> maxYValue, const QVEdgeInsets& insets,
                                        std::shared_ptr<const QVChartDataSet> dataSet) {
    imageSize_ = size;
    insets_ = insets;
    minXValue_ = minXValue;
    maxXValue_ = maxXValue;
    minYValue_ = minYValue;
    maxYValue_ = maxYValue;
    dataSet_ = std::move(dataSet);
}

void QVChartSeries::renderChart(QPainter&) const {}
void QVChartSeries::renderFill(QPainter&) const {}
void QVChartSeries::renderSecondaryFill(QPainter&) const {}
void QVChartSeries::selectedPointIndexesUpdated(const std::vector<size_t>&) {}

QSizeF QVChartSeries::renderSize() const {
    return {imageSize_.width() - insets_.left - insets_.right,
            imageSize_.height() - insets_.top - insets_.bottom};
}

double QVChartSeries::relativePosition(double value, double lower, double upper) {
    return upper == lower ? 0.5 : (value - lower) / (upper - lower);
}

double QVChartSeries::xForChartPoint(const QVChartPoint& point) const {
    double position = 0.5;
    if (minXValue_ && maxXValue_)
        position = relativePosition(VSSecondsFromDuration(point.xValue() - *minXValue_), 0,
                                    VSSecondsFromDuration(*maxXValue_ - *minXValue_));
    // A product of fractions ends a hair below the point that it means, and neighbours would come nearer.
    return std::floor(position * renderSize().width() + 1e-6) + insets_.left;
}

double QVChartSeries::yForValue(std::optional<double> value) const {
    const double lower = minYValue_.value_or(0);
    const double upper = maxYValue_.value_or(0);
    const double height = renderSize().height();
    // The maximum is at the top, where y is 0.
    const double position = upper == lower ? 0.5 : (upper - value.value_or(0)) / (upper - lower);
    return std::clamp(std::floor(position * height), 0.0, std::max(height, 0.0)) + insets_.top;
}

QPointF QVChartSeries::pointFromChartPoint(const QVChartPoint& point) const {
    const std::vector<double> values = point.allYValues();
    return {xForChartPoint(point), yForValue(values.empty() ? std::nullopt : std::optional(values.back()))};
}

double QVChartSeries::widthHeldApart(double width) const {
    if (!pointInterval_ || !minXValue_ || !maxXValue_ || *minXValue_ >= *maxXValue_) return width;
    return widthHeldApart(width, renderSize().width() * VSSecondsFromDuration(*pointInterval_) /
                                     VSSecondsFromDuration(*maxXValue_ - *minXValue_));
}

double QVChartSeries::widthHeldApart(double width, double pitch) {
    // Points stand on whole points of the image: some are nearer to each other than the mean.
    return std::min(width, kDrawnShare * (pitch > 1 ? std::floor(pitch) : pitch));
}

bool QVChartSeries::yValueIsClamped(std::optional<double> value) const {
    return value && maxYValue_ && *value > *maxYValue_;
}
