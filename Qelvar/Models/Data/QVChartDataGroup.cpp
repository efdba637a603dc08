#include "Qelvar/Models/Data/QVChartDataGroup.h"

#include <algorithm>
#include <cmath>

#include "Vessa/Base/VSLog.h"

namespace {

void logStub(const char* operation) {
    VSLog(VSLogLevel::Error, std::string("Stub method called: ") + operation);
}

// The best of what the sets answer, leaving out those without an answer; the first of equal ones.
template <typename Answer, typename Beats>
auto bestOfSets(const std::vector<std::shared_ptr<QVChartDataSet>>& sets, Answer answer, Beats beats) {
    decltype(answer(*sets.front())) best;
    for (const auto& set : sets)
        if (const auto candidate = answer(*set); candidate && (!best || beats(*candidate, *best)))
            best = candidate;
    return best;
}

}  // namespace

std::shared_ptr<QVChartDataGroup> QVChartDataGroup::copy() const {
    auto result = create();
    result->dataSets_.reserve(dataSets_.size());
    for (const auto& set : dataSets_) result->dataSets_.push_back(std::make_shared<QVChartDataSet>(*set));
    return result;
}

std::shared_ptr<QVChartDataSet> QVChartDataGroup::dataSetAtIndex(size_t index) const {
    return index < dataSets_.size() ? dataSets_[index] : nullptr;
}

std::optional<double> QVChartDataGroup::averageYValue() const {
    double sum = 0;
    size_t count = 0;
    for (const auto& set : dataSets_) {
        for (const auto& point : set->allDataPoints()) {
            const auto average = point->averageYValue();
            if (!average) continue;
            sum += *average;
            ++count;
        }
    }
    const double mean = sum / static_cast<double>(count);
    if (count == 0 || std::isnan(mean)) return std::nullopt;
    return mean;
}

std::optional<VSDate> QVChartDataGroup::minXValue() const {
    return bestOfSets(
        dataSets_, [](const QVChartDataSet& set) { return set.minXValue(); }, std::less<>());
}

std::optional<VSDate> QVChartDataGroup::maxXValue() const {
    return bestOfSets(
        dataSets_, [](const QVChartDataSet& set) { return set.maxXValue(); }, std::greater<>());
}

bool QVChartDataGroup::isEmpty() const {
    return std::all_of(dataSets_.begin(), dataSets_.end(),
                       [](const auto& set) { return set->numDataPoints() == 0; });
}

void QVChartDataGroup::reloadData() {
    const auto source = dataSource_.lock();
    const size_t count = source ? source->numberOfDataSetsInGroup(*this) : 0;
    std::vector<std::shared_ptr<QVChartDataSet>> sets;
    sets.reserve(count);
    for (size_t index = 0; index < count; ++index) {
        auto set = dataSetAtIndex(index);
        if (!set) {
            set = std::make_shared<QVChartDataSet>();
            set->setDataSource(weak_from_this());
            set->setTag(index);
        }
        set->reloadData();
        sets.push_back(std::move(set));
    }
    dataSets_ = std::move(sets);
    minYValue_ = bestOfSets(
        dataSets_, [](const QVChartDataSet& set) { return set.minYValue(); }, std::less<>());
    maxYValue_ = bestOfSets(
        dataSets_, [](const QVChartDataSet& set) { return set.maxYValue(); }, std::greater<>());
}

void QVChartDataGroup::reloadDataInSetAtIndex(size_t setIndex) {
    if (const auto set = dataSetAtIndex(setIndex))
        set->reloadData();
    else
        VSLog(VSLogLevel::Error, "Error: index " + std::to_string(setIndex) + " out of bounds");
}

void QVChartDataGroup::reloadDataPointInSetAtIndex(size_t setIndex, size_t pointIndex) {
    if (const auto set = dataSetAtIndex(setIndex)) set->reloadDataPointAtIndex(pointIndex);
}

void QVChartDataGroup::addDataPoint(VSDate, double, size_t) {
    logStub("addDataPointWithXValue:yValue:setIndex:");
}

void QVChartDataGroup::removeDataPointFromSetAtIndex(size_t, size_t) {
    logStub("removeDataPointFromSetAtIndex:pointIndex:");
}

size_t QVChartDataGroup::numberOfDataPointsForDataSet(const QVChartDataSet& dataSet) {
    const auto source = dataSource_.lock();
    return source ? source->numberOfPointsInSetAtIndex(*this, dataSet.tag()) : 0;
}

QVChartPointPtr QVChartDataGroup::chartPointForIndex(const QVChartDataSet& dataSet, size_t index) {
    const auto source = dataSource_.lock();
    return source ? source->pointForSetAtIndex(*this, dataSet.tag(), index) : nullptr;
}

std::vector<QVChartPointPtr> QVChartDataGroup::dataPointsForSet(const QVChartDataSet&) {
    logStub("dataPointsForSet:");
    return {};
}

QVChartPointAnnotationPtr QVChartDataGroup::annotationForPointAtIndex(const QVChartDataSet& dataSet,
                                                                      size_t index) {
    const auto source = dataSource_.lock();
    return source ? source->annotationForPointInSetAtIndex(*this, dataSet.tag(), index) : nullptr;
}

std::string QVChartDataGroup::description() const {
    std::string sets = "(";
    for (const auto& set : dataSets_) sets += (sets.size() > 1 ? ", " : "") + set->description();
    return "Data Sets: " + sets + ")";
}
