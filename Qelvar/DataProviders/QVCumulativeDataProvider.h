#pragma once

#include "Qelvar/DataProviders/QVDataProvider.h"

/// For quantities that add up (steps, energy): a point per calendar bucket with its total, empty buckets
/// included; the secondary value is the mean total of the buckets that hold data (the days of the last 7 days
/// in the day scope, the days of the last 12 months in the year scope, the visible buckets else); the current
/// value is the total of the day on which the most recent sample started, dated at the last moment of that
/// sample within that day.
class QVCumulativeDataProvider final : public QVDataProvider {
 public:
    using QVDataProvider::QVDataProvider;

    void restartQueries() override;
    void stopQueries() override;
    const char* className() const override { return "QVCumulativeDataProvider"; }

 private:
    /// Whether the average of the scope comes from a query of its own and not from the chart's buckets.
    static bool shouldExecuteAverageQuery(QVTimeScope timeScope);
    void restartCurrentValueQuery();
    void restartHistoricalDataQuery();
    void restartAverageQuery();
    void updateMostRecentStatistics(const Error& error);
    void updateMostRecentStatistics(const VSQuantitySample& mostRecent, Ticket ticket);

    QVRunningQuery statisticsQuery_;
    QVRunningQuery currentValueQuery_;
    QVRunningQuery averageQuery_;
};
