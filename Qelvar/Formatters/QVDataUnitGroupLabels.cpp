#include "Qelvar/Formatters/QVDataUnitGroupLabels.h"

#include <algorithm>
#include <cmath>
#include <utility>

#include "Platform/Localization.h"
#include "Qelvar/Models/Data/QVTimeScope.h"

namespace {

// What is known of a display type with enumerated values. The values are those of its category type, kept on
// disk.
struct EnumeratedGroup {
    int groupID;
    std::vector<std::pair<int, const char*>> labelKeys;
    std::vector<int> stackingOrder;  // rows from the top
};

const EnumeratedGroup* enumeratedGroup(const VSDataUnitGroup* group) {
    static const std::vector<EnumeratedGroup> groups{
        {VSGroupID::SleepAnalysis, {{0, "IN_BED"}, {1, "ASLEEP"}}, {0, 1}},
        {VSGroupID::StandHours, {{0, "STOOD"}, {1, "IDLE"}}, {1, 0}},
        {VSGroupID::CervicalMucusQuality,
         {{1, "DRY"}, {2, "STICKY"}, {3, "CREAMY"}, {4, "WATERY"}, {5, "EGG_WHITE"}},
         {5, 4, 3, 2, 1}},
        {VSGroupID::OvulationTestResult, {{1, "NEGATIVE"}, {2, "POSITIVE"}, {3, "INDETERMINATE"}}, {2, 1, 3}},
        {VSGroupID::MenstrualFlow,
         {{1, "UNSPECIFIED"}, {2, "LIGHT"}, {3, "MEDIUM"}, {4, "HEAVY"}},
         {4, 3, 2, 1}},
    };
    const auto found = std::find_if(groups.begin(), groups.end(), [&](const auto& entry) {
        return entry.groupID == group->dataUnitGroupID();
    });
    return found == groups.end() ? nullptr : &*found;
}

}  // namespace

std::map<int, QString> qv_enumeratedValueLabels(const VSDataUnitGroup* group) {
    std::map<int, QString> labels;
    if (const auto* known = enumeratedGroup(group))
        for (const auto& [value, key] : known->labelKeys) labels.emplace(value, platform::localized(key));
    return labels;
}

const QString* qv_labelForNumber(const std::map<int, QString>& labels, double number) {
    // Compared as doubles: a number may be too large for an integer, or none at all.
    const auto found =
        std::find_if(labels.begin(), labels.end(),
                     [whole = std::trunc(number)](const auto& entry) { return entry.first == whole; });
    return found == labels.end() ? nullptr : &found->second;
}

std::optional<QString> qv_displayNameForEnumValue(const VSDataUnitGroup* group, int value) {
    if (group->dataUnitGroupID() == VSGroupID::Workouts) {
        const std::string* activity = VSWorkoutActivityTypeIdentifier(value);
        if (!activity) return std::nullopt;
        return platform::localized(activity->c_str());
    }
    const auto labels = qv_enumeratedValueLabels(group);
    const auto found = labels.find(value);
    if (found == labels.end()) return std::nullopt;
    return found->second;
}

std::vector<int> qv_valueOrderForStackedCharts(const VSDataUnitGroup* group) {
    const auto* known = enumeratedGroup(group);
    return known ? known->stackingOrder : std::vector<int>{0};
}

int qv_stackedChartSectionsCount(const VSDataUnitGroup* group) {
    if (group->chartingRules().chartStyleForTimeScope(QVTimeScopeIndex(QVTimeScope::Day)) ==
        VSChartStyle::CenteredLine)
        return 1;
    const auto* known = enumeratedGroup(group);
    return known ? static_cast<int>(known->labelKeys.size()) : 1;
}

bool qv_interactiveChartsDataSourceDependsOnTimeScope(const VSDataUnitGroup* group) {
    const int id = group->dataUnitGroupID();
    return id == VSGroupID::SleepAnalysis || id == VSGroupID::Workouts || id == VSGroupID::StandHours;
}

namespace {

/// Says of which time a bar is the total; null where that is a day, or where it is no total.
const char* keyOfPeriod(const VSDataUnitGroup* group, QVTimeScope timeScope) {
    const bool addsUp = group->anyDataUnit()->dataType()->isCumulative() ||
                        qv_interactiveChartsDataSourceDependsOnTimeScope(group);
    if (!addsUp) return nullptr;
    const VSDateComponents bar =
        group->chartingRules().intervalComponentsForTimeScope(QVTimeScopeIndex(timeScope));
    if (bar == VSDateComponents{.hours = 1}) return "PER_HOUR %@";
    if (bar == VSDateComponents{.months = 1}) return "PER_MONTH %@";
    return nullptr;
}

}  // namespace

QString qv_dashboardChartBoundStringFromValue(const VSDataUnitGroup* group, QVTimeScope timeScope,
                                              double value, const VSNumberFormatter& defaultNumberFormatter,
                                              const VSUnitController& unitController) {
    const VSDataUnit* dataUnit = group->anyDataUnit();
    const auto own =
        qv_numberFormatterForUnit(dataUnit->dataType(), unitController.unitForDataUnit(dataUnit));
    const QString text = QVStringFromNumberInDisplayRange(value, dataUnit, unitController, true,
                                                          own ? own.get() : &defaultNumberFormatter);
    const char* period = keyOfPeriod(group, timeScope);
    return period && value != 0 ? platform::localized(period, {text}) : text;
}
