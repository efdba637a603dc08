#pragma once

#include "Qelvar/DataProviders/QVDataProvider.h"

/// For samples whose only meaning is that they happened: a point per bucket with the number of samples. The
/// secondary value is the end of the latest sample (in its last day: VSLastMomentOfSample), in seconds since
/// the reference date, for all time scopes. There is no current value.
class QVCountDataProvider final : public QVDataProvider {
 public:
    using QVDataProvider::QVDataProvider;

    void restartQueries() override;
    void stopQueries() override;
    bool showsCurrentValue() const override { return false; }
    /// "Last activity" and its date.
    platform::StyledText secondaryValueText() const override;
    const char* className() const override { return "QVCountDataProvider"; }

 private:
    void restartSecondaryValueQuery();
    void updateSecondaryValue(const Error& error);
    void restartHistoricalDataQuery();
    struct Range {
        VSDate start, end;
        VSDateComponents interval;
        QVTimeScope timeScope;
    };
    void updateHistoricalData(const Range& range, const Error& error);

    QVRunningQuery secondaryValueQuery_;
    QVRunningQuery historicalDataQuery_;
};
