#pragma once

#include "Qelvar/DataProviders/QVMostRecentSampleDataProvider.h"

/// For single readings (weight): a point per bucket that holds data, with its average; the secondary value is
/// the average of all samples of the last 7 days (day and week scope), 31 days (month) or 12 months (year);
/// the current value is the most recent sample.
class QVDiscreteAverageDataProvider final : public QVMostRecentSampleDataProvider {
 public:
    using QVMostRecentSampleDataProvider::QVMostRecentSampleDataProvider;

    void restartQueries() override;
    void stopQueries() override;
    const char* className() const override { return "QVDiscreteAverageDataProvider"; }

 private:
    CurrentValueLogs currentValueLogs() const override {
        return {"Error with current value query", "Error updating most recent object"};
    }
    void restartAverageQuery();
    void updateAverageMatching(const VSPredicate& predicate, QVTimeScope timeScope, const Error& error);
    void restartHistoricalDataQuery();
    std::shared_ptr<VSQuery> historicalDataQuery(VSDate start, std::optional<VSDate> end,
                                                 const VSDateComponents& interval);

    QVRunningQuery statisticsQuery_;
    QVRunningQuery averageQuery_;
};
