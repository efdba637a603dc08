#include "Qelvar/DataProviders/QVTimePeriodDataProvider.h"

#include <algorithm>
#include <set>

#include "Qelvar/DataProviders/QVHealthStoreExtensions.h"
#include "Vessa/Base/VSEnvironment.h"

namespace {

using Points = QVDataProvider::Points;
using Samples = std::vector<VSSamplePtr>;
constexpr VSDateComponents oneDay{.days = 1};

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

/// The time of the spans in [start, end), in hours, and the last moment of it.
std::pair<double, VSDate> totalOf(const Spans& spans, VSDate start, VSDate end) {
    VSDuration total{0};
    VSDate last = start;
    for (const VSTimeSpan& span : spans) {
        const VSTimeSpan part{std::max(span.start, start), std::min(span.end, end)};
        if (part.start >= part.end) continue;
        total += part.length();
        last = std::max(last, part.end);
    }
    return {VSSecondsFromDuration(total) / 3600, VSLastMomentOfSpan({start, last}, VSCalendar::current())};
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

void QVTimePeriodDataProvider::takeDateTotals(std::map<VSDate, double> totals, Ticket ticket) {
    if (ticket < dateTotalsTicket_) return;
    dateTotalsTicket_ = ticket;
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
        // What begins after today's noon is tomorrow's, in a year as in a week.
        const VSDate noon = calendar.noonOfDay(VSEnvironment::current()->now());
        if (range.start < noon) range.end = std::min(range.end, noon);
    }
    dateTotalsTicket_ = beginQuery(Answer::Historical, timeScope());
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
        onMainQueue(this, [ticket](QVTimePeriodDataProvider& self, const std::map<VSDate, double>& totals) {
            self.takeDateTotals(totals, ticket);
        });
    const auto countedInTotals =
        dataUnit()->chartingPredicateForTimeScope(QVTimeScopeIndex(QVTimeScope::Week));
    fetchSamples(
        range, [captured, range, averageDays, takeTotals, countedInTotals, dayPoints = dayPoints(),
                all = processAllSamples_](const VSResult<Samples>& answer, const VSTimePeriodRules& rules) {
            const Intake& intake = captured.intake;
            if (answer && range.timeScope != QVTimeScope::Day)
                return reportBuckets(spansOf(*answer, rules), rules, captured);
            // Before the points, so that who is told of points finds the totals that belong to them.
            if (answer && all) {
                VSTimePeriodRules ofTotals = rules;
                ofTotals.counted = countedInTotals;
                takeTotals(totalsByDay(spansOf(*answer, ofTotals), ofTotals, captured));
            }
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
    const auto week = QVTimeScopeSpan(QVTimeScope::Week, VSEnvironment::current()->now(),
                                      chartingRules().shouldStartDayAtNoon());
    const Range range{week->start, week->end, QVTimeScope::Week};
    fetchSamples(range, [intake = intake(), range, timeScope, ticket](const VSResult<Samples>& answer,
                                                                      const VSTimePeriodRules& rules) {
        if (!answer) return intake.logError("Error fetching samples for average calculation", answer.error());
        intake.updateAverage(
            averageOf(totalsOf(spansOf(*answer, rules), rules, range.start, range.end, oneDay)), {}, {},
            timeScope, std::nullopt, {}, ticket);
    });
}

// The current value: an observer, then the most recent samples, then the time of their days.

/// The way back to the most recent day that has time. The latest sample's may have none: a sample may have no
/// length, or lie in what a source that counts before its own has watched.
struct QVTimePeriodDataProvider::Search {
    static constexpr int mostSamples = 4096, growth = 16;
    static constexpr size_t mostDays = 32;

    Ticket ticket;
    int samples = 16;                            // asked for; more when none of them has time
    bool thereAreMore = false;                   // than these
    std::set<VSDate> days = {}, emptyDays = {};  // by their starts: still to look at, and without time
};

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
    lookAtMostRecentSamples(std::make_shared<Search>(Search{ticket}));
}

void QVTimePeriodDataProvider::lookAtMostRecentSamples(const std::shared_ptr<Search>& search) {
    // The week's predicate, as for the total: what does not count has no day.
    VSPredicate begun =
        VSPredicate::samplesStartingBefore(VSEnvironment::current()->now() + std::chrono::microseconds(1));
    if (const auto charted = dataUnit()->chartingPredicateForTimeScope(QVTimeScopeIndex(QVTimeScope::Week)))
        begun = *charted & begun;
    const auto take = [search](QVTimePeriodDataProvider& self, const VSResult<Samples>& answer) {
        if (!answer) {
            self.intake().logError("Error getting most recent start date", answer.error());
            return self.intake().updateCurrentValue({}, {}, answer.error(), {}, search->ticket);
        }
        const VSCalendar calendar = VSCalendar::current();
        const bool nights = self.chartingRules().shouldStartDayAtNoon();
        for (const VSSamplePtr& sample : *answer) {
            if (sample->startDate() == sample->endDate()) continue;
            const VSDate day = nights ? VSStartOfNoonDay(VSStartOfNight(*sample, calendar), calendar)
                                      : calendar.startOfDay(sample->startDate());
            if (!search->emptyDays.contains(day)) search->days.insert(day);
        }
        search->thereAreMore = static_cast<int>(answer->size()) == search->samples;
        self.lookAtLatestDay(search);
    };
    mostRecentSamplesOfType(*healthStore(), dataUnit()->sampleType(), begun, search->samples,
                            onMainQueue(this, take));
}

void QVTimePeriodDataProvider::lookAtLatestDay(const std::shared_ptr<Search>& search) {
    const bool mayGoOn = search->emptyDays.size() < Search::mostDays;
    if (mayGoOn && search->days.empty() && search->thereAreMore && search->samples < Search::mostSamples) {
        search->samples *= Search::growth;
        return lookAtMostRecentSamples(search);
    }
    if (!mayGoOn || search->days.empty())
        return intake().updateCurrentValue({}, {}, std::nullopt, {}, search->ticket);
    const VSDate start = *search->days.rbegin();
    search->days.erase(start);
    search->emptyDays.insert(start);
    const VSCalendar calendar = VSCalendar::current();
    const VSDate next =
        chartingRules().shouldStartDayAtNoon() ? VSEndOfNoonDay(start, calendar) : calendar.addDays(start, 1);
    const Range day{start, next, QVTimeScope::Week};
    const auto lookBefore =
        onMainQueue(this, [search](QVTimePeriodDataProvider& self) { self.lookAtLatestDay(search); });
    fetchSamples(day, [intake = intake(), day, lookBefore, ticket = search->ticket](
                          const VSResult<Samples>& answer, const VSTimePeriodRules& rules) {
        if (!answer) {
            intake.logError("Error calculating total duration", answer.error());
            intake.updateCurrentValue({}, {}, answer.error(), {}, ticket);
            return;
        }
        const auto [hours, end] = totalOf(spansOf(*answer, rules), day.start, day.end);
        if (hours <= 0) return lookBefore();
        intake.updateCurrentValue(hours, end, std::nullopt, {}, ticket);
    });
}
