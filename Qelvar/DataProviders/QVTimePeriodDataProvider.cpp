#include "Qelvar/DataProviders/QVTimePeriodDataProvider.h"

#include <algorithm>

#include "Qelvar/DataProviders/QVHealthStoreExtensions.h"
#include "Vessa/Base/VSEnvironment.h"
#include "VessaUI/VSTimePeriods.h"

namespace {

using Points = QVDataProvider::Points;
using Samples = std::vector<VSSamplePtr>;
constexpr VSDateComponents oneDay{.days = 1};

void addSpanPoints(Points& points, const std::vector<VSTimeSpan>& spans, double y) {
    for (const VSTimeSpan& span : spans) {
        points.push_back(QVChartPointNumeric::chartPoint(span.start, y));
        points.push_back(QVChartPointNumeric::chartPoint(span.end, y));
    }
}

Points joinedDayPoints(const Samples& samples) {
    Points points;
    addSpanPoints(points, VSCoalesceTimePeriodsFromSamples(samples), 0);
    return points;
}

Points dayPointsByValue(const Samples& samples) {
    std::map<int, Samples> byValue;
    for (const VSSamplePtr& sample : samples)
        if (const auto* category = dynamic_cast<const VSCategorySample*>(sample.get()))
            byValue[category->value()].push_back(sample);
    Points points;
    for (const auto& [value, samplesOfValue] : byValue)
        addSpanPoints(points, VSCoalesceTimePeriodsFromSamples(samplesOfValue), value);
    return points;
}

/// The mean of the buckets that hold data; none when that is no time at all.
std::optional<double> averageOf(const std::vector<VSDurationInBucket>& totals) {
    double sum = 0;
    for (const VSDurationInBucket& total : totals) sum += total.hours;
    if (totals.empty() || sum <= 0) return std::nullopt;
    return sum / static_cast<double>(totals.size());
}

/// What a chart query was made for.
struct Captured {
    QVDataProvider::Intake intake;
    VSDate start, end;
    QVTimeScope timeScope;
    VSDateComponents interval;
    bool noonDays, useEndDate;
    QVDataProvider::Ticket ticket;
};

VSDate xOf(const VSTimeSpan& bucket, bool useEndDate) {
    return useEndDate ? bucket.end : VSMidDate(bucket.start, bucket.end);
}

std::vector<VSDurationInBucket> totalsOf(const Samples& samples, const Captured& captured,
                                         const VSDateComponents& interval) {
    return VSCalculateTotalDurations(VSCoalesceTimePeriodsFromSamples(samples, captured.start, captured.end),
                                     captured.start, captured.end, interval, captured.noonDays,
                                     VSCalendar::current());
}

void reportBuckets(const Samples& samples, const Captured& captured) {
    const auto totals = totalsOf(samples, captured, captured.interval);
    Points points;
    for (const VSDurationInBucket& total : totals)
        points.push_back(
            QVChartPointNumeric::chartPoint(xOf(total.bucket, captured.useEndDate), total.hours));
    captured.intake.updateHistoricalData(std::move(points), captured.timeScope, std::nullopt, {},
                                         captured.ticket);
    const auto average =
        averageOf(captured.timeScope == QVTimeScope::Year ? totalsOf(samples, captured, oneDay) : totals);
    if (average)
        captured.intake.updateAverage(average, {}, {}, captured.timeScope, std::nullopt, {}, captured.ticket);
}

std::map<VSDate, double> totalsByDay(const Samples& samples, const Captured& captured) {
    const VSCalendar calendar = VSCalendar::current();
    std::map<VSDate, double> result;
    for (const VSDurationInBucket& total : totalsOf(samples, captured, oneDay))
        result[calendar.startOfDay(xOf(total.bucket, captured.useEndDate))] += total.hours;
    return result;
}

}  // namespace

void QVTimePeriodDataProvider::restartQueries() {
    QVDataProvider::restartQueries();
    if (needsCurrentValueQuery(currentValueQuery_)) restartCurrentValueQuery();
    restartHistoricalDataQuery();
}

void QVTimePeriodDataProvider::stopQueries() {
    QVDataProvider::stopQueries();
    currentValueQuery_.stop();
    historicalDataQuery_.stop();
}

QVDataProvider::Value QVTimePeriodDataProvider::totalForDate(VSDate date) const {
    const auto entry = dateTotals_.find(date);
    return entry == dateTotals_.end() ? std::nullopt : Value(entry->second);
}

void QVTimePeriodDataProvider::takeDateTotals(std::map<VSDate, double> totals) {
    dateTotals_ = std::move(totals);
    dates_.clear();
    for (const auto& [date, hours] : dateTotals_) dates_.push_back(date);
}

QVTimePeriodDataProvider::DayPoints QVTimePeriodDataProvider::dayPoints() const {
    return joinedDayPoints;
}

QVTimePeriodDataProvider::DayPoints QVStackedCategoryValueDataProvider::dayPoints() const {
    return dayPointsByValue;
}

bool QVTimePeriodDataProvider::shouldUseEndDateForTimeScope(QVTimeScope timeScope) const {
    return chartingRules().shouldStartDayAtNoon() && timeScope != QVTimeScope::Year;
}

VSPredicate QVTimePeriodDataProvider::predicateForSamples(VSDate start, VSDate end,
                                                          QVTimeScope timeScope) const {
    const VSPredicate dates = VSQuery::predicateForSamples(start, end, VSQueryOptionNone);
    const auto charted = dataUnit()->chartingPredicateForTimeScope(QVTimeScopeIndex(timeScope));
    return charted ? dates & *charted : dates;
}

// The chart

void QVTimePeriodDataProvider::restartHistoricalDataQuery() {
    historicalDataQuery_.stop();
    if (!startDate() || !endDate() || !intervalComponentsForTimeScope(timeScope())) return;
    Range range{*startDate(), *endDate(), timeScope()};
    if (chartingRules().shouldStartDayAtNoon() && timeScope() != QVTimeScope::Day) {
        const VSCalendar calendar = VSCalendar::current();
        range.start = calendar.yesterdayAtNoon(range.start);
        // The end of a year span is its last second: the noon meant is that before the midnight that follows.
        range.end = calendar.yesterdayAtNoon(range.end + std::chrono::seconds(1));
    }
    beginQuery(Answer::Historical, timeScope());
    beginQuery(Answer::Secondary, timeScope());
    auto handler = onMainQueue(this, [range](QVTimePeriodDataProvider& self, const Error& error) {
        self.fetchSamples(range, error);
    });
    historicalDataQuery_.start(
        healthStore(),
        std::make_shared<VSObserverQuery>(
            dataUnit()->sampleType(), predicateForSamples(range.start, range.end, range.timeScope), handler));
}

void QVTimePeriodDataProvider::fetchSamples(const Range& range, const Error& error) {
    const Ticket ticket = nextTicket();
    if (error) {
        intake().logError("Error executing historical data query", *error);
        intake().updateHistoricalData({}, range.timeScope, error, {}, ticket);
        return;
    }
    const Captured captured{intake(),
                            range.start,
                            range.end,
                            range.timeScope,
                            *intervalComponentsForTimeScope(range.timeScope),
                            chartingRules().shouldStartDayAtNoon(),
                            shouldUseEndDateForTimeScope(range.timeScope),
                            ticket};
    const auto averageDays =
        onMainQueue(this, [scope = range.timeScope, ticket](QVTimePeriodDataProvider& self) {
            self.updateDailyAverage(scope, ticket);
        });
    const auto takeTotals =
        onMainQueue(this, [](QVTimePeriodDataProvider& self, const std::map<VSDate, double>& totals) {
            self.takeDateTotals(totals);
        });
    execute(std::make_shared<VSSampleQuery>(
        dataUnit()->sampleType(), predicateForSamples(range.start, range.end, range.timeScope),
        VSObjectQueryNoLimit, std::vector<VSSortDescriptor>{{VSSampleSortIdentifierStartDate, true}},
        [captured, averageDays, takeTotals, dayPoints = dayPoints(),
         all = processAllSamples_](const VSResult<Samples>& answer) {
            if (!answer || answer->empty()) {
                const Error failure = answer ? std::nullopt : Error(answer.error());
                captured.intake.updateHistoricalData({}, captured.timeScope, failure, {}, captured.ticket);
                captured.intake.updateAverage({}, {}, {}, captured.timeScope, failure, {}, captured.ticket);
                return;
            }
            if (captured.timeScope != QVTimeScope::Day) return reportBuckets(*answer, captured);
            // Before the points, so that who is told of points finds the totals that belong to them.
            if (all) takeTotals(totalsByDay(*answer, captured));
            captured.intake.updateHistoricalData(dayPoints(*answer), captured.timeScope, std::nullopt, {},
                                                 captured.ticket);
            averageDays();
        }));
}

void QVTimePeriodDataProvider::updateDailyAverage(QVTimeScope timeScope, Ticket ticket) {
    const auto week = QVTimeScopeSpan(QVTimeScope::Week, VSEnvironment::current()->now(), false);
    VSDate start = week->start, end = week->end;
    const bool noonDays = chartingRules().shouldStartDayAtNoon();
    if (noonDays) {
        start = VSCalendar::current().yesterdayAtNoon(start);
        end = VSCalendar::current().yesterdayAtNoon(end);
    }
    const Captured captured{intake(), start, end, timeScope, oneDay, noonDays, false, ticket};
    execute(std::make_shared<VSSampleQuery>(
        dataUnit()->sampleType(), predicateForSamples(start, end, QVTimeScope::Week), VSObjectQueryNoLimit,
        std::vector<VSSortDescriptor>{{VSSampleSortIdentifierStartDate, true}},
        [captured](const VSResult<Samples>& answer) {
            if (!answer)
                return captured.intake.logError("Error fetching samples for average calculation",
                                                answer.error());
            captured.intake.updateAverage(averageOf(totalsOf(*answer, captured, oneDay)), {}, {},
                                          captured.timeScope, std::nullopt, {}, captured.ticket);
        }));
}

// The current value: an observer, then the most recent sample, then the time of its day.

void QVTimePeriodDataProvider::restartCurrentValueQuery() {
    beginQuery(Answer::CurrentValue);
    auto handler = onMainQueue(
        this, [](QVTimePeriodDataProvider& self, const Error& error) { self.updateCurrentValue(error); });
    currentValueQuery_.start(
        healthStore(), std::make_shared<VSObserverQuery>(dataUnit()->sampleType(), VSPredicate{}, handler));
}

void QVTimePeriodDataProvider::updateCurrentValue(const Error& error) {
    const Ticket ticket = nextTicket();
    if (error) {
        intake().logError("Error executing current value query", *error);
        intake().updateCurrentValue({}, {}, error, {}, ticket);
        return;
    }
    mostRecentSampleOfType(
        *healthStore(), dataUnit()->sampleType(),
        dataUnit()->chartingPredicateForTimeScope(QVTimeScopeIndex(timeScope())),
        onMainQueue(this, [ticket](QVTimePeriodDataProvider& self, const VSResult<VSSamplePtr>& answer) {
            if (answer && *answer) return self.updateCurrentValue((*answer)->startDate(), ticket);
            if (!answer) self.intake().logError("Error getting most recent start date", answer.error());
            self.intake().updateCurrentValue({}, {}, answer ? std::nullopt : Error(answer.error()), {},
                                             ticket);
        }));
}

void QVTimePeriodDataProvider::updateCurrentValue(VSDate mostRecentStart, Ticket ticket) {
    const VSCalendar calendar = VSCalendar::current();
    VSDate start = calendar.startOfDay(mostRecentStart);
    if (chartingRules().shouldStartDayAtNoon()) {
        const VSDate noon = calendar.noonOfDay(mostRecentStart);
        start = mostRecentStart >= noon ? noon : calendar.yesterdayAtNoon(mostRecentStart);
    }
    const VSDate end = calendar.addDays(start, 1);
    execute(std::make_shared<VSSampleQuery>(
        dataUnit()->sampleType(), predicateForSamples(start, end, QVTimeScope::Week), VSObjectQueryNoLimit,
        std::vector<VSSortDescriptor>{{VSSampleSortIdentifierStartDate, true}},
        [intake = intake(), start, end, ticket](const VSResult<Samples>& answer) {
            if (!answer) {
                intake.logError("Error calculating total duration", answer.error());
                intake.updateCurrentValue({}, {}, answer.error(), {}, ticket);
                return;
            }
            VSDuration total{0};
            const auto spans = VSCoalesceTimePeriodsFromSamples(*answer, start, end);
            for (const VSTimeSpan& span : spans) total += span.length();
            if (total <= VSDuration::zero())
                return intake.updateCurrentValue({}, {}, std::nullopt, {}, ticket);
            intake.updateCurrentValue(VSSecondsFromDuration(total) / 3600, spans.back().end, std::nullopt, {},
                                      ticket);
        }));
}
