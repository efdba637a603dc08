#include "Qelvar/DataProviders/QVBasalBodyTemperatureDataProvider.h"

namespace {

QVChartPointPtr averagePoint(const VSStatistics& bucket, const VSDataUnit*, const VSUnit& unit) {
    const auto average = bucket.averageQuantity();
    return QVChartPointNumeric::chartPoint(
        VSMidDate(bucket.startDate, bucket.endDate),
        average ? std::optional(average->doubleValueForUnit(unit)) : std::nullopt);
}

}  // namespace

int QVBasalBodyTemperatureDataProvider::statisticsOptionsForTimeScope(QVTimeScope timeScope) const {
    if (timeScope == QVTimeScope::Year)
        return QVDiscreteMinMaxDataProvider::statisticsOptionsForTimeScope(timeScope);
    return VSStatisticsOptionDiscreteAverage;
}

QVDiscreteMinMaxDataProvider::PointMaker QVBasalBodyTemperatureDataProvider::chartPointMakerForTimeScope(
    QVTimeScope timeScope) const {
    if (timeScope == QVTimeScope::Year)
        return QVDiscreteMinMaxDataProvider::chartPointMakerForTimeScope(timeScope);
    return averagePoint;
}
