#pragma once

#include <memory>
#include <vector>

#include "Qelvar/Charts/QVChartSeries.h"
#include "Qelvar/Charts/QVChartSeriesPointMarker.h"
#include "Qelvar/Models/Data/QVTimeScope.h"
#include "VessaUI/VSDataUnitGroup.h"

/// The series that draw a display type in a time scope, one for each data unit in their order; null where the
/// charting rules name no style. Main thread.
std::vector<std::shared_ptr<const QVChartSeries>> QVChartSeriesForDataUnitGroup(const VSDataUnitGroup* group,
                                                                                QVTimeScope timeScope);

/// How the values of the data unit at an index are marked, in charts and texts.
QVPointStyle QVPointStyleForDataUnitAtIndex(const VSDataUnitGroup* group, size_t index);
