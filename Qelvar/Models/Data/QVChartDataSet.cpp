#include "Qelvar/Models/Data/QVChartDataSet.h"

#include <cmath>
#include <limits>

#include "Vessa/Base/VSLog.h"

namespace {

// The first of the best: a candidate must beat what there is.
template <typename T, typename Beats>
void keepBest(std::optional<T>& best, const std::optional<T>& candidate, Beats beats) {
    if (candidate && (!best || beats(*candidate, *best))) best = candidate;
}

void logStub(const char* operation) {
    VSLog(VSLogLevel::Error, std::string("Stub method called: ") + operation);
}

void annotate(QVChartPoint& point, QVChartPointAnnotationPtr annotation) {
    // Copies of the set that are being drawn share the point: it is written only when there is something to
    // change.
    if (point.annotation() != annotation) point.setAnnotation(std::move(annotation));
}

}  // namespace

std::optional<double> QVChartDataSet::minYValue() const {
    std::optional<double> best;
    for (const auto& point : *data_) keepBest(best, point->minYValue(), std::less<>());
    return best;
}

std::optional<double> QVChartDataSet::maxYValue() const {
    std::optional<double> best;
    for (const auto& point : *data_) keepBest(best, point->maxYValue(), std::greater<>());
    return best;
}

std::optional<double> QVChartDataSet::totalYValue() const {
    double total = 0;
    for (const auto& point : *data_) total += point->averageYValue().value_or(0);
    if (!std::isfinite(total)) return std::nullopt;
    return total;
}

std::optional<double> QVChartDataSet::averageYValue() const {
    const auto total = totalYValue();
    if (!total) return std::nullopt;
    if (data_->empty()) return std::numeric_limits<double>::quiet_NaN();
    return *total / static_cast<double>(data_->size());
}

std::optional<VSDate> QVChartDataSet::minXValue() const {
    std::optional<VSDate> best;
    for (const auto& point : *data_) keepBest(best, std::optional(point->xValue()), std::less<>());
    return best;
}

std::optional<VSDate> QVChartDataSet::maxXValue() const {
    std::optional<VSDate> best;
    for (const auto& point : *data_) keepBest(best, std::optional(point->xValue()), std::greater<>());
    return best;
}

void QVChartDataSet::reloadData() {
    auto points = std::make_shared<std::vector<QVChartPointPtr>>();
    if (const auto source = dataSource_.lock()) {
        const size_t count = source->numberOfDataPointsForDataSet(*this);
        points->reserve(count);
        for (size_t index = 0; index < count; ++index) {
            auto point = source->chartPointForIndex(*this, index);
            if (!point) continue;
            annotate(*point, source->annotationForPointAtIndex(*this, index));
            points->push_back(std::move(point));
        }
    }
    data_ = std::move(points);
}

void QVChartDataSet::reloadDataPointAtIndex(size_t index) {
    const auto source = dataSource_.lock();
    if (index >= data_->size() || !source) return;
    auto point = source->chartPointForIndex(*this, index);
    if (!point) return;
    annotate(*point, source->annotationForPointAtIndex(*this, index));
    auto points = std::make_shared<std::vector<QVChartPointPtr>>(*data_);
    (*points)[index] = std::move(point);
    data_ = std::move(points);
}

void QVChartDataSet::addDataPoint(VSDate, double, QVChartPointAnnotationPtr) {
    logStub("addDataPointWithXValue:yValue:annotation:");
}

void QVChartDataSet::removeDataPointAtIndex(size_t) {
    logStub("removeDataPointAtIndex:");
}

void QVChartDataSet::normalizeData() {
    normalizeData(minYValue(), maxYValue(), minXValue(), maxXValue());
}

void QVChartDataSet::normalizeData(std::optional<double>, std::optional<double>, std::optional<VSDate>,
                                   std::optional<VSDate>) {
    logStub("normalizeDataWithMinYValue:maxYValue:minXValue:maxXValue:");
}

std::string QVChartDataSet::description() const {
    std::string result = "(";
    for (const auto& point : *data_) result += (result.size() > 1 ? ", " : "") + point->description();
    return result + ")";
}
