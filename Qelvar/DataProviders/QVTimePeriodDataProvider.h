#pragma once

#include <map>
#include <memory>
#include <vector>

#include "Qelvar/DataProviders/QVDataProvider.h"
#include "VessaUI/VSTimePeriods.h"

/// For samples that are spans of time (sleep, workouts), each moment counted once and by the order of sources
/// (VSCoalesceTimePeriodsFromSamples says how): the day scope shows each span as a pair of points, the longer
/// scopes the hours in each bucket that has any. The secondary value is the mean of the daily totals of days
/// that have any (of the last 7 days in the day scope, of the visible ones in the year scope; of the visible
/// buckets else), the current value the hours of the most recent day that has time that counts in longer
/// scopes, whatever is visible; both in hours. What starts after now counts nowhere.
///
/// Where the charting rules start days at noon, a day reaches from the noon before to its own noon, and
/// nights stand at the hours at which they were lived; the longer scopes end at today's noon.
class QVTimePeriodDataProvider : public QVDataProvider {
 public:
    using QVDataProvider::QVDataProvider;

    void restartQueries() override;
    void stopQueries() override;
    const char* className() const override { return "QVTimePeriodDataProvider"; }

    /// Whether day-scope refreshes also compute the totals of all visible days, over the samples that count
    /// in the longer scopes. Set before restartQueries.
    bool processAllSamples() const { return processAllSamples_; }
    void setProcessAllSamples(bool process) { processAllSamples_ = process; }
    /// The starts of the days that have a total, ascending.
    const std::vector<VSDate>& dates() const { return dates_; }
    /// In hours, for the start of a day.
    Value totalForDate(VSDate date) const;

 protected:
    struct Range {
        VSDate start, end;
        QVTimeScope timeScope;
    };
    /// The points of a day, which the range spans. Called on the store's threads.
    using DayPoints = Points (*)(const std::vector<VSSamplePtr>& samples, const VSTimePeriodRules& rules,
                                 const Range& range);
    virtual DayPoints dayPoints() const;
    /// Totals with an earlier ticket than those kept, or than the running query, come too late.
    void takeDateTotals(std::map<VSDate, double> totals, Ticket ticket);

 private:
    void restartCurrentValueQuery();
    void updateCurrentValue(const Error& error);
    struct Search;
    void lookAtMostRecentSamples(const std::shared_ptr<Search>& search);
    void lookAtLatestDay(const std::shared_ptr<Search>& search);
    void restartHistoricalDataQuery();
    void updateHistoricalData(const Range& range, const Error& error);
    void updateDailyAverage(QVTimeScope timeScope, Ticket ticket);
    /// The predicate that finds the samples of a range, wherever they were recorded.
    VSPredicate predicateForSamples(const Range& range) const;
    /// Asks for the samples of the range, ascending, and how they become spans. The handler is called on the
    /// main thread with an error or on the store's.
    using SamplesHandler =
        std::function<void(const VSResult<std::vector<VSSamplePtr>>&, const VSTimePeriodRules&)>;
    void fetchSamples(const Range& range, const SamplesHandler& handler);
    bool shouldUseEndDateForTimeScope(QVTimeScope timeScope) const;

    QVRunningQuery historicalDataQuery_;
    QVRunningQuery currentValueQuery_;
    bool processAllSamples_ = false;
    std::map<VSDate, double> dateTotals_;  // hours by the start of the day
    std::vector<VSDate> dates_;
    Ticket dateTotalsTicket_ = 0;
};

/// For spans of several kinds (stood and idle hours): the day scope shows the spans of each category value at
/// that y.
class QVStackedCategoryValueDataProvider final : public QVTimePeriodDataProvider {
 public:
    using QVTimePeriodDataProvider::QVTimePeriodDataProvider;
    const char* className() const override { return "QVStackedCategoryValueDataProvider"; }

 protected:
    DayPoints dayPoints() const override;
};
