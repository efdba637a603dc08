#pragma once

#include <QString>
#include <map>
#include <memory>
#include <optional>

#include "Vessa/VSObjectType.h"
#include "VessaUI/VSDataUnitGroup.h"
#include "VessaUI/VSNumberFormatter.h"
#include "VessaUI/VSUnitController.h"

/// A decimal number in the user's locale (digits, grouping, decimal separator, as they are at the call) with
/// at most so many fraction digits, rounded half to even. Immutable; any thread.
class QVDecimalNumberFormatter final : public VSNumberFormatter {
 public:
    explicit QVDecimalNumberFormatter(int maximumFractionDigits)
        : maximumFractionDigits_(maximumFractionDigits) {}
    int maximumFractionDigits() const { return maximumFractionDigits_; }
    QString stringFromNumber(double number) const;
    std::optional<QString> stringFromNumber(double number, const VSDataUnit* dataUnit,
                                            const VSUnitController& unitController) const override;

 private:
    int maximumFractionDigits_;
};

/// The shared decimal formatter of a number of fraction digits. Lives until the process ends. Any thread.
std::shared_ptr<const QVDecimalNumberFormatter> QVNumberFormatterWithFractionDigits(int fractionDigits);

/// Hours as hours and minutes, cut to whole minutes ("7 hr 30 min").
class QVTimePeriodNumberFormatter final : public VSNumberFormatter {
 public:
    explicit QVTimePeriodNumberFormatter(bool shouldRoundToHours = false)
        : shouldRoundToHours_(shouldRoundToHours) {}
    bool shouldRoundToHours() const { return shouldRoundToHours_; }
    void setShouldRoundToHours(bool round) { shouldRoundToHours_ = round; }
    std::optional<QString> stringFromNumber(double hours, const VSDataUnit* dataUnit,
                                            const VSUnitController& unitController) const override;

 private:
    bool shouldRoundToHours_;
};

/// Lengths: feet and inches when the user's unit is the foot.
class QVHeightNumberFormatter final : public VSNumberFormatter {
 public:
    std::optional<QString> stringFromNumber(double number, const VSDataUnit* dataUnit,
                                            const VSUnitController& unitController) const override;
};

/// The label of an enumerated value; none for a value without one. The fraction is dropped.
class QVEnumeratedDataUnitNumberFormatter final : public VSNumberFormatter {
 public:
    /// Takes the labels in the language of that moment.
    explicit QVEnumeratedDataUnitNumberFormatter(const VSDataUnitGroup* group);
    std::optional<QString> stringFromNumber(double number, const VSDataUnit* dataUnit,
                                            const VSUnitController& unitController) const override;

 private:
    std::map<int, QString> valueLabels_;
};

/// The formatter that the data type's code asks for (height, time intervals); null for other types. Shared
/// objects.
std::shared_ptr<const VSNumberFormatter> qv_numberFormatterForUnit(const VSObjectType* type,
                                                                   const VSUnit& unit);
/// The same, else a decimal formatter with the fraction digits of the display type's charting rules. Never
/// null.
std::shared_ptr<const VSNumberFormatter> qv_numberFormatterForUnit(const VSDataUnit* dataUnit,
                                                                   const VSUnit& unit);

/// The formatted number; with `clampToDisplayRange`, "more than" the maximum or "less than" the minimum of
/// the unit's display range outside it. An amount that is there and would read 0 is "less than" the smallest
/// that can be written. A null formatter means the data unit's own for the user's unit. Empty
/// when the formatter has no text.
QString QVStringFromNumberInDisplayRange(double number, const VSDataUnit* dataUnit,
                                         const VSUnitController& unitController, bool clampToDisplayRange,
                                         const VSNumberFormatter* numberFormatter = nullptr);
/// "5 ft 11 in", of a number of feet.
QString QVFeetAndInchesString(double feet);
/// What stands for a missing value.
QString QVNoDataString();
/// "72 bpm": a number and its unit in plain text.
QString QVValueUnitString(const QString& value, const QString& unit);
