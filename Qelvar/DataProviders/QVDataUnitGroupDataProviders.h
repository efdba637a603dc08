#pragma once

#include <memory>

#include "Qelvar/DataProviders/QVDataProvider.h"
#include "VessaUI/VSDataUnitGroup.h"

/// A new provider of the class that charts the data unit of the display type: the one place that knows which.
/// Never null. REQUIRES: one of the display type's units. Main thread.
std::shared_ptr<QVDataProvider> qv_dataProviderForDataUnit(
    const VSDataUnitGroup* group, const VSDataUnit* dataUnit,
    const VSDataUnitGroupChartingRules& chartingRules, const std::shared_ptr<VSHealthStore>& healthStore,
    const std::shared_ptr<VSUnitController>& unitController);
