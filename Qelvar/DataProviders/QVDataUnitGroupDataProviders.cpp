#include "Qelvar/DataProviders/QVDataUnitGroupDataProviders.h"

#include "Qelvar/DataProviders/QVBasalBodyTemperatureDataProvider.h"
#include "Qelvar/DataProviders/QVCountDataProvider.h"
#include "Qelvar/DataProviders/QVCumulativeDataProvider.h"
#include "Qelvar/DataProviders/QVDiscreteAverageDataProvider.h"
#include "Qelvar/DataProviders/QVDiscreteMinMaxDataProvider.h"
#include "Qelvar/DataProviders/QVSamplesExistDataProvider.h"
#include "Qelvar/DataProviders/QVTimePeriodDataProvider.h"
#include "Qelvar/DataProviders/QVUnchartedDataProvider.h"

namespace {

using Factory = std::shared_ptr<QVDataProvider> (*)(const VSDataUnit*, const VSDataUnitGroupChartingRules&,
                                                    const std::shared_ptr<VSUnitController>&,
                                                    const std::shared_ptr<VSHealthStore>&);

template <typename Provider>
std::shared_ptr<QVDataProvider> make(const VSDataUnit* dataUnit,
                                     const VSDataUnitGroupChartingRules& chartingRules,
                                     const std::shared_ptr<VSUnitController>& unitController,
                                     const std::shared_ptr<VSHealthStore>& healthStore) {
    return std::make_shared<Provider>(dataUnit, chartingRules, unitController, healthStore);
}

/// The display types whose provider does not follow from their data type.
constexpr struct {
    int groupID;
    Factory factory;
} table[] = {
    {VSGroupID::SleepAnalysis, make<QVTimePeriodDataProvider>},
    {VSGroupID::Workouts, make<QVTimePeriodDataProvider>},
    {VSGroupID::StandHours, make<QVStackedCategoryValueDataProvider>},
    {VSGroupID::BasalBodyTemperature, make<QVBasalBodyTemperatureDataProvider>},
    {VSGroupID::CervicalMucusQuality, make<QVSamplesExistDataProvider>},
    {VSGroupID::OvulationTestResult, make<QVOvulationDataProvider>},
    {VSGroupID::SexualActivity, make<QVCountDataProvider>},
    {VSGroupID::MenstrualFlow, make<QVMenstruationDataProvider>},
    {VSGroupID::Spotting, make<QVSpottingDataProvider>},
};

Factory factoryForDataType(const VSObjectType* type, VSChartStyle defaultChartStyle) {
    if (!type->isQuantityType()) return make<QVUnchartedDataProvider>;
    if (type->isCumulative()) return make<QVCumulativeDataProvider>;
    if (defaultChartStyle == VSChartStyle::MinMax) return make<QVDiscreteMinMaxDataProvider>;
    return make<QVDiscreteAverageDataProvider>;
}

}  // namespace

std::shared_ptr<QVDataProvider> qv_dataProviderForDataUnit(
    const VSDataUnitGroup* group, const VSDataUnit* dataUnit,
    const VSDataUnitGroupChartingRules& chartingRules, const std::shared_ptr<VSHealthStore>& healthStore,
    const std::shared_ptr<VSUnitController>& unitController) {
    Factory factory = nullptr;
    for (const auto& row : table)
        if (row.groupID == group->dataUnitGroupID()) factory = row.factory;
    if (!factory) factory = factoryForDataType(dataUnit->dataType(), chartingRules.defaultChartStyle());
    return factory(dataUnit, chartingRules, unitController, healthStore);
}
