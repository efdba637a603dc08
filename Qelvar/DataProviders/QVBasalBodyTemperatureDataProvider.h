#pragma once

#include "Qelvar/DataProviders/QVDiscreteMinMaxDataProvider.h"

/// Points of bucket averages in every time scope but the year, where it charts ranges as its parent does. The
/// secondary values are the lowest and the highest of what is charted.
class QVBasalBodyTemperatureDataProvider final : public QVDiscreteMinMaxDataProvider {
 public:
    using QVDiscreteMinMaxDataProvider::QVDiscreteMinMaxDataProvider;
    const char* className() const override { return "QVBasalBodyTemperatureDataProvider"; }

 protected:
    int statisticsOptionsForTimeScope(QVTimeScope timeScope) const override;
    PointMaker chartPointMakerForTimeScope(QVTimeScope timeScope) const override;
};
