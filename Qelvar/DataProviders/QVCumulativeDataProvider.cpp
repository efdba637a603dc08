#include "Qelvar/DataProviders/QVCumulativeDataProvider.h"

#include <algorithm>

#include "Qelvar/DataProviders/QVHealthStoreExtensions.h"
#include "Vessa/Base/VSEnvironment.h"

namespace {

using Collection = std::shared_ptr<const VSStatisticsCollection>;

/// What a query was made for: its answers are read by this, whatever is visible by then.
struct Captured {
    QVDataProvider::Intake intake;
    const VSDataUnit* dataUnit;
    VSUnit unit;
    QVTimeScope timeScope;
    QVDataProvider::Ticket historicalTicket = 0, secondaryTicket = 0;
};

std::optional<double> totalOf(const VSStatistics& statistics, const Captured& captured) {
    const auto sum = statistics.sumQuantity();
    if (!sum) return std::nullopt;
    return sum->doubleValueForUnit(captured.unit);
}

QVChartPointPtr chartPoint(const VSStatistics& statistics, const Captured& captured) {
    auto total = totalOf(statistics, captured);
    if (total) total = captured.dataUnit->adjustedValueForDaemonValue(*total);
    return QVChartPointNumeric::chartPoint(VSMidDate(statistics.startDate, statistics.endDate), total);
}

void reportPoints(const VSResult<Collection>& answer, const Captured& captured, VSDate start, VSDate end) {
    if (!answer) {
        captured.intake.updateHistoricalData({}, captured.timeScope, answer.error(), captured.unit,
                                             captured.historicalTicket);
        return;
    }
    QVDataProvider::Points points;
    (*answer)->enumerateStatistics(
        start, end, [&](const VSStatistics& bucket) { points.push_back(chartPoint(bucket, captured)); });
    const bool hasData = std::any_of(points.begin(), points.end(),
                                     [](const auto& point) { return point->maxYValue().has_value(); });
    if (!hasData) points.clear();
    captured.intake.updateHistoricalData(std::move(points), captured.timeScope, std::nullopt, captured.unit,
                                         captured.historicalTicket);
}

/// The mean total of the buckets that hold data.
void reportAverage(const VSResult<Collection>& answer, const Captured& captured) {
    std::optional<double> average;
    if (answer && !(*answer)->statistics().empty()) {
        double sum = 0;
        for (const VSStatistics& bucket : (*answer)->statistics())
            sum += totalOf(bucket, captured).value_or(0);
        const auto buckets = static_cast<double>((*answer)->statistics().size());
        average = captured.dataUnit->adjustedValueForDaemonValue(sum / buckets);
    }
    captured.intake.updateAverage(average, {}, {}, captured.timeScope,
                                  answer ? std::nullopt : std::optional(answer.error()), captured.unit,
                                  captured.secondaryTicket);
}

}  // namespace

bool QVCumulativeDataProvider::shouldExecuteAverageQuery(QVTimeScope timeScope) {
    return timeScope == QVTimeScope::Day || timeScope == QVTimeScope::Year;
}

void QVCumulativeDataProvider::restartQueries() {
    QVDataProvider::restartQueries();
    if (needsCurrentValueQuery(currentValueQuery_)) restartCurrentValueQuery();
    restartAverageQuery();
    restartHistoricalDataQuery();
}

void QVCumulativeDataProvider::stopQueries() {
    QVDataProvider::stopQueries();
    currentValueQuery_.stop();
    averageQuery_.stop();
    statisticsQuery_.stop();
}

void QVCumulativeDataProvider::restartHistoricalDataQuery() {
    statisticsQuery_.stop();
    const auto interval = intervalComponentsForTimeScope(timeScope());
    if (!startDate() || !endDate() || !interval) return;
    const VSDate start = *startDate(), end = *endDate();
    Captured captured{intake(), dataUnit(), preferredUnit(), timeScope()};
    captured.historicalTicket = beginQuery(Answer::Historical, timeScope());
    const bool givesAverage = !shouldExecuteAverageQuery(timeScope());
    if (givesAverage) captured.secondaryTicket = beginQuery(Answer::Secondary, timeScope());

    auto query = std::make_shared<VSStatisticsCollectionQuery>(
        dataUnit()->dataType(), VSQuery::predicateForSamples(start, end, VSQueryOptionNone),
        VSStatisticsOptionCumulativeSum, start, *interval);
    const auto handler = [=](const char* what) {
        return [=](const VSResult<Collection>& answer) {
            if (!answer) captured.intake.logError(what, answer.error());
            reportPoints(answer, captured, start, end);
            if (givesAverage) reportAverage(answer, captured);
        };
    };
    query->initialResultsHandler = handler("Error with historical initial results");
    query->statisticsUpdateHandler = handler("Error with historical updated results");
    statisticsQuery_.start(healthStore(), std::move(query));
}

void QVCumulativeDataProvider::restartAverageQuery() {
    if (!shouldExecuteAverageQuery(timeScope())) return;
    const QVTimeScope averaged = timeScope() == QVTimeScope::Day ? QVTimeScope::Week : QVTimeScope::Year;
    const auto span = QVTimeScopeSpan(averaged, VSEnvironment::current()->now(), false);
    Captured captured{intake(), dataUnit(), preferredUnit(), timeScope()};
    captured.secondaryTicket = beginQuery(Answer::Secondary, timeScope());

    auto query = std::make_shared<VSStatisticsCollectionQuery>(
        dataUnit()->dataType(), VSQuery::predicateForSamples(span->start, span->end, VSQueryOptionNone),
        VSStatisticsOptionCumulativeSum, span->start, VSDateComponents{.days = 1});
    const auto handler = [=](const char* what) {
        return [=](const VSResult<Collection>& answer) {
            if (!answer) captured.intake.logError(what, answer.error());
            reportAverage(answer, captured);
        };
    };
    query->initialResultsHandler = handler("Error with average initial results");
    query->statisticsUpdateHandler = handler("Error with average update results");
    averageQuery_.start(healthStore(), std::move(query));
}

// The current value: an observer, then the most recent sample, then the total of its day.

void QVCumulativeDataProvider::restartCurrentValueQuery() {
    beginQuery(Answer::CurrentValue);
    auto handler = onMainQueue(this, [](QVCumulativeDataProvider& self, const Error& error) {
        self.updateMostRecentStatistics(error);
    });
    currentValueQuery_.start(
        healthStore(), std::make_shared<VSObserverQuery>(dataUnit()->dataType(), VSPredicate{}, handler));
}

void QVCumulativeDataProvider::updateMostRecentStatistics(const Error& error) {
    const Ticket ticket = nextTicket();
    if (error) {
        intake().logError("Error calling in updateMostRecentStatistics", *error);
        intake().updateCurrentValue({}, {}, error, {}, ticket);
        return;
    }
    mostRecentQuantitySampleOfType(
        *healthStore(), dataUnit()->sampleType(), std::nullopt,
        onMainQueue(this, [ticket](QVCumulativeDataProvider& self,
                                   const VSResult<std::shared_ptr<const VSQuantitySample>>& answer) {
            if (answer && *answer) return self.updateMostRecentStatistics(**answer, ticket);
            if (!answer) self.intake().logError("Error retrieving most recent sample", answer.error());
            self.intake().updateCurrentValue({}, {}, answer ? std::nullopt : Error(answer.error()), {},
                                             ticket);
        }));
}

void QVCumulativeDataProvider::updateMostRecentStatistics(const VSQuantitySample& mostRecent, Ticket ticket) {
    const VSCalendar calendar = VSCalendar::current();
    const VSDate from = calendar.startOfDay(mostRecent.startDate());
    const VSDate to = calendar.addDays(from, 1);
    // What the sample added after midnight is in the total of the next day.
    const VSDate date = dateOfCurrentValue({mostRecent.startDate(), std::min(mostRecent.endDate(), to)});
    const Captured captured{intake(), dataUnit(), preferredUnit(), timeScope()};
    execute(std::make_shared<VSStatisticsQuery>(
        dataUnit()->dataType(), VSQuery::predicateForSamples(from, to, VSQueryOptionNone),
        VSStatisticsOptionCumulativeSum, [captured, ticket, date](const VSResult<VSStatistics>& answer) {
            const auto total = answer ? totalOf(*answer, captured) : std::nullopt;
            if (total) {
                captured.intake.updateCurrentValue(captured.dataUnit->adjustedValueForDaemonValue(*total),
                                                   date, std::nullopt, captured.unit, ticket);
                return;
            }
            if (!answer) captured.intake.logError("Error updating most recent statistics", answer.error());
            captured.intake.updateCurrentValue({}, {}, answer ? std::nullopt : std::optional(answer.error()),
                                               {}, ticket);
        }));
}
