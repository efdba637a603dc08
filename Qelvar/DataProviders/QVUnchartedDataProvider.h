#pragma once

#include "Qelvar/DataProviders/QVDataProvider.h"

/// For display types without samples (characteristics): there is nothing to load, and that is loaded at once.
class QVUnchartedDataProvider final : public QVDataProvider {
 public:
    using QVDataProvider::QVDataProvider;
    void restartQueries() override {
        QVDataProvider::restartQueries();
        intake().updateCurrentValue({}, {}, std::nullopt);
        intake().updateAverage({}, {}, {}, timeScope(), std::nullopt);
        intake().updateHistoricalData({}, timeScope(), std::nullopt);
    }
    platform::StyledText secondaryValueText() const override { return {}; }
    const char* className() const override { return "QVUnchartedDataProvider"; }
};
