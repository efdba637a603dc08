#pragma once

#include "Qelvar/DataProviders/QVMostRecentSampleDataProvider.h"

/// For single readings that are shown as ranges (heart rate): a point {"min", "max"} per bucket that holds
/// data; the secondary values are the lowest minimum and highest maximum of the visible span; the current
/// value is the most recent sample.
class QVDiscreteMinMaxDataProvider : public QVMostRecentSampleDataProvider {
 public:
    using QVMostRecentSampleDataProvider::QVMostRecentSampleDataProvider;

    void restartQueries() override;
    void stopQueries() override;
    /// Minimum and maximum with their labels, in reading order.
    platform::StyledText secondaryValueText() const override;
    const char* className() const override { return "QVDiscreteMinMaxDataProvider"; }

 protected:
    /// The statistics (VSStatisticsOptions) of a bucket that its point is made of.
    virtual int statisticsOptionsForTimeScope(QVTimeScope timeScope) const;
    /// Makes the point of a bucket, with numbers in the unit. Called on the store's threads.
    using PointMaker = QVChartPointPtr (*)(const VSStatistics& bucket, const VSDataUnit* dataUnit,
                                           const VSUnit& unit);
    virtual PointMaker chartPointMakerForTimeScope(QVTimeScope timeScope) const;

 private:
    CurrentValueLogs currentValueLogs() const override {
        return {"Error executing current value query", "Error fetching most recent sample"};
    }
    void restartHistoricalDataQuery();
    std::shared_ptr<VSQuery> historicalDataQuery(VSDate start, std::optional<VSDate> end,
                                                 const VSDateComponents& interval);

    QVRunningQuery statisticsQuery_;
};
