#pragma once

#include <QString>
#include <map>
#include <optional>
#include <vector>

#include "Qelvar/Formatters/QVNumberFormatters.h"
#include "Qelvar/Models/Data/QVTimeScope.h"
#include "VessaUI/VSDataUnitGroup.h"

/// Labels of a display type's enumerated values, in the user's language; empty for types without. Any thread.
std::map<int, QString> qv_enumeratedValueLabels(const VSDataUnitGroup* group);
/// The label of a number without its fraction; null when there is none.
const QString* qv_labelForNumber(const std::map<int, QString>& labels, double number);
/// The name of one value, or none; for workouts the name of the activity.
std::optional<QString> qv_displayNameForEnumValue(const VSDataUnitGroup* group, int value);
/// The values that have a row in a stacked chart, from the top.
std::vector<int> qv_valueOrderForStackedCharts(const VSDataUnitGroup* group);
/// How many rows a stacked chart has, at least 1.
int qv_stackedChartSectionsCount(const VSDataUnitGroup* group);
/// Whether the landscape chart asks for other data in each time scope: durations are summed over its spans.
bool qv_interactiveChartsDataSourceDependsOnTimeScope(const VSDataUnitGroup* group);
/// The text beside a bound of a dashboard chart, in the user's unit, held in the display range. The default
/// formatter serves where the data type has none of its own. Where the bars of what adds up are not of a day,
/// as the figure above them is, the text says of what: "800,000/mo".
QString qv_dashboardChartBoundStringFromValue(const VSDataUnitGroup* group, QVTimeScope timeScope,
                                              double value, const VSNumberFormatter& defaultNumberFormatter,
                                              const VSUnitController& unitController);
