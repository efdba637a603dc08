#pragma once

#include <QColor>
#include <QString>
#include <QStringList>
#include <memory>
#include <vector>

#include "VessaUI/VSDataUnit.h"
#include "VessaUI/VSDataUnitGroupChartingRules.h"

/// Display-type IDs that the program speaks of. Kept on disk in the dashboard's selection; never reused.
namespace VSGroupID {
inline constexpr int Height = 3, HeartRate = 6, WalkingRunningDistance = 7, ActiveEnergy = 8,
                     FlightsClimbed = 10, BloodPressure = 13, SleepAnalysis = 58, Steps = 59,
                     CyclingDistance = 71, Workouts = 72, Water = 73, StandHours = 75,
                     BasalBodyTemperature = 76, CervicalMucusQuality = 77, OvulationTestResult = 78,
                     SexualActivity = 79, MenstrualFlow = 80, UVExposure = 81, Spotting = 82;
}

struct VSDataUnitGroupRow;

/// A display type: what a card, a list and an entry screen show. Lives in the catalogue until the process
/// ends; compared by address. Immutable; texts follow the user's language.
class VSDataUnitGroup {
 public:
    int dataUnitGroupID() const;
    int categoryID() const;
    QString displayName() const;
    /// One paragraph for its page; may be empty.
    QString summary() const;
    /// Words to find it by.
    QStringList keywords() const;
    /// Its units in their natural order.
    const std::vector<const VSDataUnit*>& dataUnits() const { return units_; }
    const std::vector<const VSDataUnit*>& dataUnitsOrderedForDataEntry() const { return units_; }
    const VSDataUnit* anyDataUnit() const { return units_.front(); }
    /// Between the values of a reading with several units: "/" for blood pressure.
    QString joinString() const;
    const VSDataUnitGroupChartingRules& chartingRules() const { return *rules_; }
    bool isCharacteristic() const;
    bool isNikeFuel() const;
    bool allowsManualEntry() const;
    bool showAllDataHierarchically() const;
    bool shouldDisplayUnitStringOnYAxis() const;
    bool unitPreferencesRequireChangeConfirmation() const;
    QString unitChangeCautionaryText() const;
    /// Names of icons (platform::icon); empty: none.
    QString unitIcon() const;
    QString groupIcon() const;
    /// The icon of its category.
    QString listIcon() const;

    VSDataUnitGroup(const VSDataUnitGroup&) = delete;
    VSDataUnitGroup& operator=(const VSDataUnitGroup&) = delete;

 private:
    friend struct VSDataUnitGroupCatalogue;
    VSDataUnitGroup() = default;
    const VSDataUnitGroupRow* row_ = nullptr;
    std::vector<const VSDataUnit*> units_;
    std::unique_ptr<const VSDataUnitGroupChartingRules> rules_;
};

/// The catalogue of display types.
class VSDataUnitGroupController {
 public:
    static const VSDataUnitGroupController& shared();
    const std::vector<const VSDataUnitGroup*>& allDataUnitGroups() const;
    const VSDataUnitGroup* dataUnitGroupWithID(int id) const;  // null: unknown
    /// The display type that shows a data type; null for a meal, which is shown through its nutrients.
    const VSDataUnitGroup* dataUnitGroupForType(const VSObjectType* type) const;
    std::vector<const VSDataUnitGroup*> dataUnitGroupsInCategory(int categoryID) const;
    /// The colour of what can be touched.
    QColor keyColor() const;
};
