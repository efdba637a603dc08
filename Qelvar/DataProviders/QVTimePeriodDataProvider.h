#pragma once

#include <map>
#include <vector>

#include "Qelvar/DataProviders/QVDataProvider.h"

/// For samples that are spans of time (sleep, workouts): overlapping ones are joined; the day scope shows
/// each span as a pair of points, the longer scopes the hours in each bucket. The secondary value is the mean
/// of the daily totals of days that have any (of the last 7 days in the day scope, of the visible ones in the
/// year scope; of the visible buckets else), the current value the hours of the most recent day that has
/// data; both in hours.
///
/// Where the charting rules start days at noon, a day reaches from the noon before to its own noon.
class QVTimePeriodDataProvider : public QVDataProvider {
 public:
    using QVDataProvider::QVDataProvider;

    void restartQueries() override;
    void stopQueries() override;
    const char* className() const override { return "QVTimePeriodDataProvider"; }

    /// Whether day-scope refreshes also compute the totals of all visible days. Set before restartQueries.
    bool processAllSamples() const { return processAllSamples_; }
    void setProcessAllSamples(bool process) { processAllSamples_ = process; }
    /// The starts of the days that have a total, ascending.
    const std::vector<VSDate>& dates() const { return dates_; }
    /// In hours, for the start of a day.
    Value totalForDate(VSDate date) const;

 protected:
    /// The points of a day. Called on the store's threads.
    using DayPoints = Points (*)(const std::vector<VSSamplePtr>& samples);
    virtual DayPoints dayPoints() const;

 private:
    struct Range {
        VSDate start, end;
        QVTimeScope timeScope;
    };
    void restartCurrentValueQuery();
    void updateCurrentValue(const Error& error);
    void updateCurrentValue(VSDate mostRecentStart, Ticket ticket);
    void restartHistoricalDataQuery();
    void fetchSamples(const Range& range, const Error& error);
    void updateDailyAverage(QVTimeScope timeScope, Ticket ticket);
    VSPredicate predicateForSamples(VSDate start, VSDate end, QVTimeScope timeScope) const;
    bool shouldUseEndDateForTimeScope(QVTimeScope timeScope) const;
    void takeDateTotals(std::map<VSDate, double> totals);

    QVRunningQuery historicalDataQuery_;
    QVRunningQuery currentValueQuery_;
    bool processAllSamples_ = false;
    std::map<VSDate, double> dateTotals_;  // hours by the start of the day
    std::vector<VSDate> dates_;
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
