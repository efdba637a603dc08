#pragma once

#include <QObject>
#include <QSet>
#include <QString>
#include <map>
#include <memory>
#include <vector>

#include "Vessa/VSHealthStore.h"
#include "VessaUI/VSDataUnitGroup.h"

/// The user's preferred units, kept in the health service's default values (key "VSPreferredUnits": a
/// dictionary from type identifier to unit string). A preference not set follows the user's region (US
/// customary in US, LR, MM; glucose in mmol/L where that is customary ...) and its changes. Until the stored
/// preferences have been read the region's units answer; the signal tells when that, or a choice in another
/// window or program, changed anything. Main thread only.
class VSUnitController : public QObject {
    Q_OBJECT
 public:
    explicit VSUnitController(std::shared_ptr<VSHealthStore> healthStore);

    VSUnit unitForDataUnit(const VSDataUnit* dataUnit) const;
    /// The units that the user may choose for a display type; empty when there is no choice to offer at all.
    std::vector<VSUnit> availableUnits(const VSDataUnitGroup* group) const;
    /// Stores the choice and tells everyone. REQUIRES: one of the units offered for the data unit.
    void updatePreferredUnit(const VSUnit& unit, const VSDataUnit* dataUnit);

    /// The unit's name in the user's unit for the data unit: "kg", "steps"; for a number in its plural form.
    QString displayNameForDataUnit(const VSDataUnit* dataUnit) const;
    QString displayNameForDataUnit(const VSDataUnit* dataUnit, double value) const;
    QString displayNameForDataUnit(const VSDataUnit* dataUnit, const VSUnit& unit) const;
    QString displayNameForDataUnitGroup(const VSDataUnitGroup* group) const;

    /// In the user's unit, as shown. None: no such range.
    std::optional<VSValueRange> displayRangeForDataUnit(const VSDataUnit* dataUnit) const;
    std::optional<VSValueRange> manualEntryAbsoluteRangeForDataUnit(const VSDataUnit* dataUnit) const;
    std::optional<VSValueRange> manualEntryConfirmRangeForDataUnit(const VSDataUnit* dataUnit) const;

 signals:
    /// VSUnitControllerUnitPreferencesDidChangeNotification, with the data types whose unit changed.
    void unitPreferencesDidChange(const QSet<const VSObjectType*>& changedTypes);

 private:
    void load();
    void wasRead(const VSResult<std::optional<VSValue>>& result, const char* what);
    void adopt(const VSValue::Dictionary& stored);
    void save();
    void localeDidChange();
    QString nameOfUnit(const VSDataUnit* dataUnit, const VSUnit& unit, std::optional<double> value) const;
    std::optional<VSValueRange> rangeInPreferredUnit(const VSDataUnit* dataUnit,
                                                     const VSValueRange& range) const;

    std::shared_ptr<VSHealthStore> healthStore_;
    std::shared_ptr<const void> observation_;
    VSValue::Dictionary unsaved_;  // choices made here that are not known to be stored
    std::map<const VSObjectType*, VSUnit> preferred_;
    std::map<const VSObjectType*, VSUnit> defaultsTold_;  // the region's, as observers know them
    std::shared_ptr<bool> alive_ = std::make_shared<bool>(true);
};
