#pragma once

#include <QString>
#include <optional>
#include <vector>

#include "Vessa/VSObjectType.h"
#include "Vessa/VSPredicate.h"
#include "VessaUI/VSTimeScopeIndex.h"

class VSDataUnitGroup;
struct VSDataUnitRow;

/// A range of numbers in a unit; a bound may be absent.
struct VSValueRange {
    std::optional<double> minimum, maximum;
    bool containsValue(double value) const {
        return (!minimum || value >= *minimum) && (!maximum || value <= *maximum);
    }
    friend bool operator==(const VSValueRange&, const VSValueRange&) = default;
};

/// One data type as a display type shows it. Lives in the catalogue until the process ends; compared by
/// address.
class VSDataUnit {
 public:
    const VSObjectType* dataType() const { return dataType_; }
    /// The type that queries and samples use (the same, but for what the catalogue says otherwise).
    const VSObjectType* sampleType() const { return dataType_; }
    const VSDataUnitGroup* dataUnitGroup() const { return group_; }
    /// The label beside its value in an entry screen ("Systolic"); empty: the unit's name serves.
    QString labelDisplayName() const;
    /// A stored number as it is shown, and back: percentages are stored as fractions and shown times 100.
    double adjustedValueForDaemonValue(double value) const { return value * factor_; }
    double adjustedValueForClientValue(double value) const { return value / factor_; }
    /// An extra filter on the samples charted in a time scope (asleep and not in bed, for sleep), or none.
    std::optional<VSPredicate> chartingPredicateForTimeScope(VSTimeScopeIndex timeScope) const;

    /// Its row in the tables of the catalogue (VessaUI/VSDataUnitGroupCatalogue.h): units to choose from and
    /// ranges.
    const VSDataUnitRow& row() const { return *row_; }

    VSDataUnit(const VSDataUnit&) = delete;
    VSDataUnit& operator=(const VSDataUnit&) = delete;

 private:
    friend struct VSDataUnitGroupCatalogue;
    VSDataUnit() = default;
    const VSObjectType* dataType_ = nullptr;
    const VSDataUnitGroup* group_ = nullptr;
    const VSDataUnitRow* row_ = nullptr;
    double factor_ = 1;
};
