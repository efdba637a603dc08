#include "Qelvar/DataProviders/QVCountDataProvider.h"

#include "Platform/Localization.h"
#include "Qelvar/DataProviders/QVHealthStoreExtensions.h"
#include "Qelvar/Formatters/QVDateFormatters.h"
#include "Qelvar/Formatters/QVNumberFormatters.h"
#include "VessaUI/VSTimePeriods.h"

void QVCountDataProvider::restartQueries() {
    QVDataProvider::restartQueries();
    if (needsSecondaryValueQuery(secondaryValueQuery_)) restartSecondaryValueQuery();
    restartHistoricalDataQuery();
}

void QVCountDataProvider::stopQueries() {
    QVDataProvider::stopQueries();
    secondaryValueQuery_.stop();
    historicalDataQuery_.stop();
}

platform::StyledText QVCountDataProvider::secondaryValueText() const {
    const Value value = secondaryValue();
    const QString text =
        value ? QVShortDateFormatter().stringFromDate(VSDate::fromSecondsSinceReferenceDate(*value))
              : QVNoDataString();
    return platform::StyledText(platform::localized("LAST_ACTIVITY %@", {text}));
}

void QVCountDataProvider::restartSecondaryValueQuery() {
    beginQuery(Answer::Secondary);
    auto handler = onMainQueue(
        this, [](QVCountDataProvider& self, const Error& error) { self.updateSecondaryValue(error); });
    secondaryValueQuery_.start(
        healthStore(), std::make_shared<VSObserverQuery>(dataUnit()->sampleType(), VSPredicate{}, handler));
}

void QVCountDataProvider::updateSecondaryValue(const Error& error) {
    const Ticket ticket = nextTicket();
    if (error) {
        intake().logErrorAlways("Error executing current value query", *error);
        intake().updateSecondaryValue({}, error, ticket);
        return;
    }
    mostRecentSampleOfType(
        *healthStore(), dataUnit()->sampleType(), std::nullopt,
        [intake = intake(), ticket](const VSResult<VSSamplePtr>& answer) {
            if (!answer) {
                intake.logErrorAlways("Error updating secondary value query", answer.error());
                intake.updateSecondaryValue({}, answer.error(), ticket);
                return;
            }
            Value latest;
            if (*answer)
                latest = VSLastMomentOfSample(**answer, VSCalendar::current()).secondsSinceReferenceDate();
            intake.updateSecondaryValue(latest, std::nullopt, ticket);
        });
}

void QVCountDataProvider::restartHistoricalDataQuery() {
    historicalDataQuery_.stop();
    const auto interval = intervalComponentsForTimeScope(timeScope());
    if (!startDate() || !endDate() || !interval) return;
    const Range range{*startDate(), *endDate(), *interval, timeScope()};
    beginQuery(Answer::Historical, timeScope());
    auto handler = onMainQueue(this, [range](QVCountDataProvider& self, const Error& error) {
        self.updateHistoricalData(range, error);
    });
    const VSPredicate predicate = VSQuery::predicateForSamples(range.start, range.end, VSQueryOptionNone);
    historicalDataQuery_.start(
        healthStore(), std::make_shared<VSObserverQuery>(dataUnit()->sampleType(), predicate, handler));
}

void QVCountDataProvider::updateHistoricalData(const Range& range, const Error& error) {
    const Ticket ticket = nextTicket();
    if (error) {
        intake().logErrorAlways("Error executing historical data query", *error);
        intake().updateHistoricalData({}, range.timeScope, error, {}, ticket);
        return;
    }
    execute(std::make_shared<VSCountStatisticsQuery>(
        dataUnit()->sampleType(), range.start, range.end, range.interval, VSPredicate(),
        [intake = intake(), scope = range.timeScope,
         ticket](const VSResult<VSCountStatisticsQuery::Counts>& answer) {
            Points points;
            if (answer) {
                for (const auto& [bucket, count] : *answer)
                    points.push_back(QVChartPointNumeric::chartPoint(VSMidDate(bucket.start, bucket.end),
                                                                     static_cast<double>(count)));
            } else {
                intake.logErrorAlways("Error executing historical data query", answer.error());
            }
            intake.updateHistoricalData(std::move(points), scope,
                                        answer ? std::nullopt : Error(answer.error()), {}, ticket);
        }));
}
