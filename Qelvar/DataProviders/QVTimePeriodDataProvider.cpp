#include "Qelvar/DataProviders/QVTimePeriodDataProvider.h"

#include <algorithm>
#include <set>

#include "Qelvar/DataProviders/QVHealthStoreExtensions.h"
#include "Vessa/Base/VSEnvironment.h"

namespace {

using Points = QVDataProvider::Points;
using Samples = std::vector<VSSamplePtr>;
constexpr VSDateComponents oneDay{.days = 1};
constexpr int samplesLookedAt = 16;

using Spans = std::vector<VSTimeSpan>;

Spans spansOf(const Samples& samples, const VSTimePeriodRules& rules) {
    return VSCoalesceTimePeriodsFromSamples(samples, rules, VSCalendar::current());
}

Points joinedDayPoints(const Samples& samples, const VSTimePeriodRules& rules, VSDate start, VSDate end,
                       double y) {
    Points points;
    for (const VSTimeSpan& span : spansOf(samples, rules)) {
        // Nights are asked for with all that may stand here, which not all of them do.
        if (span.start >= end || span.end < start) continue;
        points.push_back(QVChartPointNumeric::chartPoint(span.start, y));
        points.push_back(QVChartPointNumeric::chartPoint(span.end, y));
    }
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
    bool useEndDate;
    QVDataProvider::Ticket ticket;
};

VSDate xOf(const VSTimeSpan& bucket, bool useEndDate) {
    return useEndDate ? bucket.end : VSMidDate(bucket.start, bucket.end);
}

std::vector<VSDurationInBucket> totalsOf(const Spans& spans, const VSTimePeriodRules& rules, VSDate start,
                                         VSDate end, const VSDateComponents& interval) {
    return VSCalculateTotalDurations(spans, start, end, interval, rules.nights, VSCalendar::current());
}

void reportBuckets(const Spans& spans, const VSTimePeriodRules& rules, const Captured& captured) {
    const auto totals = totalsOf(spans, rules, captured.start, captured.end, captured.interval);
    Points points;
    for (const VSDurationInBucket& total : totals)
        points.push_back(
            QVChartPointNumeric::chartPoint(xOf(total.bucket, captured.useEndDate), total.hours));
    captured.intake.updateHistoricalData(std::move(points), captured.timeScope, std::nullopt, {},
                                         captured.ticket);
    const auto average = averageOf(captured.timeScope == QVTimeScope::Year
                                       ? totalsOf(spans, rules, captured.start, captured.end, oneDay)
                                       : totals);
    captured.intake.updateAverage(average, {}, {}, captured.timeScope, std::nullopt, {}, captured.ticket);
}

std::map<VSDate, double> totalsByDay(const Spans& spans, const VSTimePeriodRules& rules,
                                     const Captured& captured) {
    const VSCalendar calendar = VSCalendar::current();
    std::map<VSDate, double> result;
    for (const VSDurationInBucket& total : totalsOf(spans, rules, captured.start, captured.end, oneDay))
        result[calendar.startOfDay(xOf(total.bucket, captured.useEndDate))] += total.hours;
    return result;
}

/// The time of the spans in [start, end), in hours, and when the last of it ended.
std::pair<double, VSDate> totalOf(const Spans& spans, VSDate start, VSDate end) {
    VSDuration total{0};
    VSDate last = start;
    for (const VSTimeSpan& span : spans) {
        const VSTimeSpan part{std::max(span.start, start), std::min(span.end, end)};
        if (part.start >= part.end) continue;
        total += part.length();
        last = std::max(last, part.end);
    }
    return {VSSecondsFromDuration(total) / 3600, last};
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
    return [](const Samples& samples, const VSTimePeriodRules& rules, const Range& range) {
        return joinedDayPoints(samples, rules, range.start, range.end, 0);
    };
}

QVTimePeriodDataProvider::DayPoints QVStackedCategoryValueDataProvider::dayPoints() const {
    return [](const Samples& samples, const VSTimePeriodRules& rules, const Range& range) {
        std::set<int> values;
        for (const VSSamplePtr& sample : samples)
            if (const auto* category = dynamic_cast<const VSCategorySample*>(sample.get()))
                values.insert(category->value());
        Points points;
        for (const int value : values) {
            VSTimePeriodRules ofValue = rules;
            ofValue.counted = VSPredicate::withCategoryValue(value);
            const Points row = joinedDayPoints(samples, ofValue, range.start, range.end, value);
            points.insert(points.end(), row.begin(), row.end());
        }
        return points;
    };
}

bool QVTimePeriodDataProvider::shouldUseEndDateForTimeScope(QVTimeScope timeScope) const {
    return chartingRules().shouldStartDayAtNoon() && timeScope != QVTimeScope::Year;
}

VSPredicate QVTimePeriodDataProvider::predicateForSamples(const Range& range) const {
    const VSDuration around =
        chartingRules().shouldStartDayAtNoon() ? VSGreatestShiftOfNights : VSDuration{0};
    return VSQuery::predicateForSamples(range.start - around, range.end + around, VSQueryOptionNone);
}

void QVTimePeriodDataProvider::fetchSamples(const Range& range, const SamplesHandler& handler) {
    VSTimePeriodRules rules{dataUnit()->chartingPredicateForTimeScope(QVTimeScopeIndex(range.timeScope)),
                            {},
                            VSEnvironment::current()->now(),
                            chartingRules().shouldStartDayAtNoon()};
    const auto ask = [predicate = predicateForSamples(range), rules, handler](
                         QVTimePeriodDataProvider& self, const VSResult<std::vector<VSSource>>& order) {
        if (!order) return handler(order.error(), rules);
        VSTimePeriodRules ordered = rules;
        ordered.sources = *order;
        self.execute(std::make_shared<VSSampleQuery>(
            self.dataUnit()->sampleType(), predicate, VSObjectQueryNoLimit,
            std::vector<VSSortDescriptor>{{VSSampleSortIdentifierStartDate, true}},
            [ordered, handler](const VSResult<Samples>& answer) { handler(answer, ordered); }));
    };
    healthStore()->orderedSources(dataUnit()->sampleType(), onMainQueue(this, ask));
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
        self.updateHistoricalData(range, error);
    });
    historicalDataQuery_.start(
        healthStore(),
        std::make_shared<VSObserverQuery>(dataUnit()->sampleType(), predicateForSamples(range), handler));
}

void QVTimePeriodDataProvider::updateHistoricalData(const Range& range, const Error& error) {
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
    fetchSamples(
        range, [captured, range, averageDays, takeTotals, dayPoints = dayPoints(), all = processAllSamples_](
                   const VSResult<Samples>& answer, const VSTimePeriodRules& rules) {
            const Intake& intake = captured.intake;
            if (answer && range.timeScope != QVTimeScope::Day)
                return reportBuckets(spansOf(*answer, rules), rules, captured);
            // Before the points, so that who is told of points finds the totals that belong to them.
            if (answer && all) takeTotals(totalsByDay(spansOf(*answer, rules), rules, captured));
            Points points;
            if (answer) points = dayPoints(*answer, rules, range);
            const bool empty = points.empty();
            const Error failure = answer ? std::nullopt : Error(answer.error());
            intake.updateHistoricalData(std::move(points), range.timeScope, failure, {}, captured.ticket);
            if (empty) return intake.updateAverage({}, {}, {}, range.timeScope, failure, {}, captured.ticket);
            averageDays();
        });
}

void QVTimePeriodDataProvider::updateDailyAverage(QVTimeScope timeScope, Ticket ticket) {
    const auto week = QVTimeScopeSpan(QVTimeScope::Week, VSEnvironment::current()->now(), false);
    Range range{week->start, week->end, QVTimeScope::Week};
    if (chartingRules().shouldStartDayAtNoon()) {
        range.start = VSCalendar::current().yesterdayAtNoon(range.start);
        range.end = VSCalendar::current().yesterdayAtNoon(range.end);
    }
    fetchSamples(range, [intake = intake(), range, timeScope, ticket](const VSResult<Samples>& answer,
                                                                      const VSTimePeriodRules& rules) {
        if (!answer) return intake.logError("Error fetching samples for average calculation", answer.error());
        intake.updateAverage(
            averageOf(totalsOf(spansOf(*answer, rules), rules, range.start, range.end, oneDay)), {}, {},
            timeScope, std::nullopt, {}, ticket);
    });
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
    // Several, for the one that ended last may be one that has no length, or that nobody ended.
    mostRecentSamplesOfType(
        *healthStore(), dataUnit()->sampleType(),
        dataUnit()->chartingPredicateForTimeScope(QVTimeScopeIndex(timeScope())), samplesLookedAt,
        onMainQueue(this, [ticket](QVTimePeriodDataProvider& self, const VSResult<Samples>& answer) {
            if (answer) return self.updateCurrentValue(*answer, ticket);
            self.intake().logError("Error getting most recent start date", answer.error());
            self.intake().updateCurrentValue({}, {}, answer.error(), {}, ticket);
        }));
}

void QVTimePeriodDataProvider::updateCurrentValue(const Samples& mostRecent, Ticket ticket) {
    const VSCalendar calendar = VSCalendar::current();
    const bool nights = chartingRules().shouldStartDayAtNoon();
    std::optional<VSDate> latest;
    for (const VSSamplePtr& sample : mostRecent) {
        if (sample->startDate() == sample->endDate()) continue;
        latest =
            std::max(latest, std::optional(nights ? VSStartOfNight(*sample, calendar) : sample->startDate()));
    }
    if (!latest) return intake().updateCurrentValue({}, {}, std::nullopt, {}, ticket);
    const VSDate start = nights ? VSStartOfNoonDay(*latest, calendar) : calendar.startOfDay(*latest);
    const Range day{start, calendar.addDays(start, 1), QVTimeScope::Week};
    fetchSamples(day, [intake = intake(), day, ticket](const VSResult<Samples>& answer,
                                                       const VSTimePeriodRules& rules) {
        if (!answer) {
            intake.logError("Error calculating total duration", answer.error());
            intake.updateCurrentValue({}, {}, answer.error(), {}, ticket);
            return;
        }
        const auto [hours, end] = totalOf(spansOf(*answer, rules), day.start, day.end);
        if (hours <= 0) return intake.updateCurrentValue({}, {}, std::nullopt, {}, ticket);
        intake.updateCurrentValue(hours, end, std::nullopt, {}, ticket);
    });
}
