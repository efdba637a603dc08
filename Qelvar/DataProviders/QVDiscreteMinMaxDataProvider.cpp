#include "Qelvar/DataProviders/QVDiscreteMinMaxDataProvider.h"

#include "Platform/Localization.h"

namespace {

// What the ends of a range are called in a point, here and in the series that draws it.
constexpr const char* minKey = "min";
constexpr const char* maxKey = "max";
constexpr double textSpacing = 6.0;

QVChartPointPtr rangePoint(const VSStatistics& bucket, const VSDataUnit* dataUnit, const VSUnit& unit) {
    QVChartYValues range;
    if (const auto minimum = bucket.minimumQuantity())
        range.emplace(minKey, dataUnit->adjustedValueForDaemonValue(minimum->doubleValueForUnit(unit)));
    if (const auto maximum = bucket.maximumQuantity())
        range.emplace(maxKey, dataUnit->adjustedValueForDaemonValue(maximum->doubleValueForUnit(unit)));
    return QVChartPointDictionary::chartPoint(VSMidDate(bucket.startDate, bucket.endDate), std::move(range));
}

struct Range {
    std::optional<double> min, max;
};

Range rangeOfPoints(const QVDataProvider::Points& points) {
    Range range;
    for (const QVChartPointPtr& point : points) {
        const auto min = point->yValueForKey(minKey);
        const auto max = point->yValueForKey(maxKey);
        if (min && (!range.min || *min < *range.min)) range.min = min;
        if (max && (!range.max || *max > *range.max)) range.max = max;
    }
    return range;
}

}  // namespace

void QVDiscreteMinMaxDataProvider::restartQueries() {
    QVDataProvider::restartQueries();
    restartCurrentValueQueryIfNeeded();
    restartHistoricalDataQuery();
}

void QVDiscreteMinMaxDataProvider::stopQueries() {
    QVMostRecentSampleDataProvider::stopQueries();
    statisticsQuery_.stop();
}

platform::StyledText QVDiscreteMinMaxDataProvider::secondaryValueText() const {
    const bool loaded = hasLoadedSecondaryValues();
    const QString min = secondaryTextForValue(loaded ? minValue() : std::nullopt);
    const QString max = secondaryTextForValue(loaded ? maxValue() : std::nullopt);
    return platform::joinForLocale({platform::StyledText(platform::localized("MIN_LONG %@", {min})),
                                    platform::StyledText::spacer(textSpacing),
                                    platform::StyledText(platform::localized("MAX_LONG %@", {max}))});
}

int QVDiscreteMinMaxDataProvider::statisticsOptionsForTimeScope(QVTimeScope) const {
    return VSStatisticsOptionDiscreteMin | VSStatisticsOptionDiscreteMax;
}

QVDiscreteMinMaxDataProvider::PointMaker QVDiscreteMinMaxDataProvider::chartPointMakerForTimeScope(
    QVTimeScope) const {
    return rangePoint;
}

void QVDiscreteMinMaxDataProvider::restartHistoricalDataQuery() {
    statisticsQuery_.stop();
    const auto interval = intervalComponentsForTimeScope(timeScope());
    if (!startDate() || !interval) return;
    statisticsQuery_.start(healthStore(), historicalDataQuery(*startDate(), endDate(), *interval));
}

std::shared_ptr<VSQuery> QVDiscreteMinMaxDataProvider::historicalDataQuery(VSDate start,
                                                                           std::optional<VSDate> end,
                                                                           const VSDateComponents& interval) {
    auto query = std::make_shared<VSStatisticsCollectionQuery>(
        dataUnit()->dataType(), VSQuery::predicateForSamples(start, end, VSQueryOptionNone),
        statisticsOptionsForTimeScope(timeScope()), start, interval);
    const auto handler = [intake = intake(), dataUnit = dataUnit(), unit = preferredUnit(),
                          scope = timeScope(), makePoint = chartPointMakerForTimeScope(timeScope()),
                          historicalTicket = beginQuery(Answer::Historical, timeScope()),
                          secondaryTicket = beginQuery(Answer::Secondary, timeScope())](const char* what) {
        return [=](const VSResult<std::shared_ptr<const VSStatisticsCollection>>& answer) {
            Points points;
            Error error;
            if (answer) {
                for (const VSStatistics& bucket : (*answer)->statistics())
                    points.push_back(makePoint(bucket, dataUnit, unit));
            } else {
                error = answer.error();
                intake.logError(what, *error);
            }
            const Range range = rangeOfPoints(points);
            intake.updateAverage({}, range.min, range.max, scope, error, unit, secondaryTicket);
            intake.updateHistoricalData(std::move(points), scope, error, unit, historicalTicket);
        };
    };
    query->initialResultsHandler = handler("Error in historical initial results");
    query->statisticsUpdateHandler = handler("Error in historical update");
    return query;
}
