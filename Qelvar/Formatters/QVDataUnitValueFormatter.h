#pragma once

#include <QFont>
#include <QString>
#include <array>
#include <memory>
#include <optional>

#include "Platform/StyledText.h"
#include "Qelvar/Formatters/QVNumberFormatters.h"

/// Value text in the value font, a space of `spacing` points if there is a unit text, unit text in the unit
/// font.
std::array<platform::StyledText, 3> QVValueAndUnitParts(const QString& valueText,
                                                        const std::optional<QString>& unitText,
                                                        const QFont& valueFont, const QFont& unitFont,
                                                        double spacing);

/// Builds the styled text of a value: number, unit name and, for some display types, an icon. Main thread
/// only.
class QVDataUnitValueFormatter {
 public:
    /// A null number formatter means the data unit's own.
    explicit QVDataUnitValueFormatter(std::shared_ptr<const VSNumberFormatter> numberFormatter)
        : numberFormatter_(std::move(numberFormatter)) {}
    virtual ~QVDataUnitValueFormatter() = default;

    /// `value` in the user's unit for the display type, as shown.
    virtual platform::StyledText attributedStringFromValue(double value, const VSDataUnitGroup* dataUnitGroup,
                                                           const VSUnitController& unitController,
                                                           const QFont& valueFont,
                                                           const QFont& unitFont) const = 0;
    /// The characters of the same text.
    QString stringFromValue(double value, const VSDataUnitGroup* dataUnitGroup,
                            const VSUnitController& unitController) const;

 protected:
    /// The number, held in the unit's display range, and the unit's name for it, two points apart.
    std::array<platform::StyledText, 3> quantityParts(double value, const VSDataUnitGroup* dataUnitGroup,
                                                      const VSUnitController& unitController,
                                                      const QFont& valueFont, const QFont& unitFont) const;
    const VSNumberFormatter* numberFormatter() const { return numberFormatter_.get(); }

 private:
    std::shared_ptr<const VSNumberFormatter> numberFormatter_;
};

/// Number, unit name, unit icon.
class QVQuantityDataUnitValueFormatter : public QVDataUnitValueFormatter {
 public:
    using QVDataUnitValueFormatter::QVDataUnitValueFormatter;
    platform::StyledText attributedStringFromValue(double value, const VSDataUnitGroup* dataUnitGroup,
                                                   const VSUnitController& unitController,
                                                   const QFont& valueFont,
                                                   const QFont& unitFont) const override;
};

/// Feet and inches where the user measures in feet, else as any quantity.
class QVHeightDataUnitValueFormatter final : public QVQuantityDataUnitValueFormatter {
 public:
    using QVQuantityDataUnitValueFormatter::QVQuantityDataUnitValueFormatter;
    platform::StyledText attributedStringFromValue(double value, const VSDataUnitGroup* dataUnitGroup,
                                                   const VSUnitController& unitController,
                                                   const QFont& valueFont,
                                                   const QFont& unitFont) const override;
};

/// Hours and minutes, rounded to the nearest minute.
class QVTimePeriodDataUnitValueFormatter final : public QVDataUnitValueFormatter {
 public:
    using QVDataUnitValueFormatter::QVDataUnitValueFormatter;
    platform::StyledText attributedStringFromValue(double value, const VSDataUnitGroup* dataUnitGroup,
                                                   const VSUnitController& unitController,
                                                   const QFont& valueFont,
                                                   const QFont& unitFont) const override;
};

/// The unit's name first ("UV Index: 5"). Chosen by those who want it, never by the data type.
class QVQuantityDataPrefixedUnitValueFormatter final : public QVDataUnitValueFormatter {
 public:
    using QVDataUnitValueFormatter::QVDataUnitValueFormatter;
    platform::StyledText attributedStringFromValue(double value, const VSDataUnitGroup* dataUnitGroup,
                                                   const VSUnitController& unitController,
                                                   const QFont& valueFont,
                                                   const QFont& unitFont) const override;
};

/// The label of an enumerated value, or the "no data" text.
class QVEnumeratedDataUnitValueFormatter final : public QVDataUnitValueFormatter {
 public:
    using QVDataUnitValueFormatter::QVDataUnitValueFormatter;
    platform::StyledText attributedStringFromValue(double value, const VSDataUnitGroup* dataUnitGroup,
                                                   const VSUnitController& unitController,
                                                   const QFont& valueFont,
                                                   const QFont& unitFont) const override;
};

enum class QVValueFormatterClass { Quantity, Height, TimePeriod, Enumerated };
/// What the values of a data type are shown by.
QVValueFormatterClass qv_valueFormatterClass(const VSObjectType* type);
/// A new formatter of that class with the data unit's number formatter for the unit.
std::unique_ptr<QVDataUnitValueFormatter> qv_valueFormatterForUnit(const VSDataUnit* dataUnit,
                                                                   const VSUnit& unit);
