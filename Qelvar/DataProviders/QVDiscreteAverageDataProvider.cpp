#include "Qelvar/DataProviders/QVDiscreteAverageDataProvider.h"

#include "Qelvar/DataProviders/QVHealthStoreExtensions.h"
#include "Vessa/Base/VSEnvironment.h"

void QVDiscreteAverageDataProvider::restartQueries() {
    QVDataProvider::restartQueries();
    restartCurrentValueQueryIfNeeded();
    restartAverageQuery();
    restartHistoricalDataQuery();
}

void QVDiscreteAverageDataProvider::stopQueries() {
    QVMostRecentSampleDataProvider::stopQueries();
    averageQuery_.stop();
    statisticsQuery_.stop();
}

void QVDiscreteAverageDataProvider::restartAverageQuery() {
    const QVTimeScope averaged = timeScope() == QVTimeScope::Day ? QVTimeScope::Week : timeScope();
    const auto span = QVTimeScopeSpan(averaged, VSEnvironment::current()->now(), false);
    VSPredicate predicate;
    if (span) predicate = VSQuery::predicateForSamples(span->start, span->end, VSQueryOptionNone);

    beginQuery(Answer::Secondary, timeScope());
    auto handler = onMainQueue(
        this, [predicate, scope = timeScope()](QVDiscreteAverageDataProvider& self, const Error& error) {
            self.updateAverageMatching(predicate, scope, error);
        });
    averageQuery_.start(healthStore(),
                        std::make_shared<VSObserverQuery>(dataUnit()->sampleType(), predicate, handler));
}

void QVDiscreteAverageDataProvider::updateAverageMatching(const VSPredicate& predicate, QVTimeScope timeScope,
                                                          const Error& error) {
    const Ticket ticket = nextTicket();
    if (error) {
        intake().logError("Error executing average query", *error);
        intake().updateAverage({}, {}, {}, timeScope, error, {}, ticket);
        return;
    }
    averageQuantityForType(*healthStore(), dataUnit()->sampleType(), preferredUnit(), predicate,
                           [intake = intake(), dataUnit = dataUnit(), unit = preferredUnit(), timeScope,
                            ticket](const VSResult<std::optional<double>>& answer) {
                               if (!answer) intake.logError("Error fetching average value", answer.error());
                               Value average = answer ? *answer : std::nullopt;
                               if (average) average = dataUnit->adjustedValueForDaemonValue(*average);
                               intake.updateAverage(average, {}, {}, timeScope,
                                                    answer ? std::nullopt : Error(answer.error()), unit,
                                                    ticket);
                           });
}

void QVDiscreteAverageDataProvider::restartHistoricalDataQuery() {
    statisticsQuery_.stop();
    const auto interval = intervalComponentsForTimeScope(timeScope());
    if (!startDate() || !interval) return;
    statisticsQuery_.start(healthStore(), historicalDataQuery(*startDate(), endDate(), *interval));
}

std::shared_ptr<VSQuery> QVDiscreteAverageDataProvider::historicalDataQuery(
    VSDate start, std::optional<VSDate> end, const VSDateComponents& interval) {
    auto query = std::make_shared<VSStatisticsCollectionQuery>(
        dataUnit()->dataType(), VSQuery::predicateForSamples(start, end, VSQueryOptionNone),
        VSStatisticsOptionDiscreteAverage, start, interval);
    const auto handler = [intake = intake(), dataUnit = dataUnit(), unit = preferredUnit(),
                          scope = timeScope(),
                          ticket = beginQuery(Answer::Historical, timeScope())](const char* what) {
        return [=](const VSResult<std::shared_ptr<const VSStatisticsCollection>>& answer) {
            Points points;
            if (answer) {
                for (const VSStatistics& bucket : (*answer)->statistics()) {
                    Value average;
                    if (const auto quantity = bucket.averageQuantity())
                        average = dataUnit->adjustedValueForDaemonValue(quantity->doubleValueForUnit(unit));
                    points.push_back(QVChartPointNumeric::chartPoint(
                        VSMidDate(bucket.startDate, bucket.endDate), average));
                }
            } else {
                intake.logError(what, answer.error());
            }
            intake.updateHistoricalData(std::move(points), scope,
                                        answer ? std::nullopt : Error(answer.error()), unit, ticket);
        };
    };
    query->initialResultsHandler = handler("Error executing historical initial results");
    query->statisticsUpdateHandler = handler("Error executing historical update results");
    return query;
}
