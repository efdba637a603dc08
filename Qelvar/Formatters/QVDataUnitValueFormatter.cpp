#include "Qelvar/Formatters/QVDataUnitValueFormatter.h"

#include <QFontMetricsF>
#include <cmath>
#include <limits>

#include "Platform/Icons.h"
#include "Platform/Localization.h"
#include "Platform/TextScale.h"
#include "Qelvar/Formatters/QVDataUnitGroupLabels.h"

using platform::StyledText;

namespace {

constexpr double epsilon = std::numeric_limits<double>::epsilon();
constexpr double unitSpacing = 2, iconSpacing = 1;

// A small mark beside the unit's name; drawn fine enough for screens of any density.
constexpr double unitIconSize = 7.5;
constexpr double unitIconScale = 4;

QImage unitIcon(const VSDataUnitGroup* group) {
    const double size = unitIconSize * platform::textScale();
    return platform::icon(group->unitIcon(), {size, size}, unitIconScale);
}

StyledText wholeNumber(double number, const QFont& font) {
    return StyledText(QVNumberFormatterWithFractionDigits(0)->stringFromNumber(number), font);
}

}  // namespace

std::array<StyledText, 3> QVValueAndUnitParts(const QString& valueText,
                                              const std::optional<QString>& unitText, const QFont& valueFont,
                                              const QFont& unitFont, double spacing) {
    const bool hasUnit = unitText.has_value();
    return {StyledText(valueText, valueFont),
            hasUnit && spacing > 0 ? StyledText::spacer(spacing) : StyledText(),
            hasUnit ? StyledText(*unitText, unitFont) : StyledText()};
}

QString QVDataUnitValueFormatter::stringFromValue(double value, const VSDataUnitGroup* dataUnitGroup,
                                                  const VSUnitController& unitController) const {
    const QFont font = platform::systemFont(0);
    return attributedStringFromValue(value, dataUnitGroup, unitController, font, font).plainText();
}

std::array<StyledText, 3> QVDataUnitValueFormatter::quantityParts(double value,
                                                                  const VSDataUnitGroup* dataUnitGroup,
                                                                  const VSUnitController& unitController,
                                                                  const QFont& valueFont,
                                                                  const QFont& unitFont) const {
    const VSDataUnit* dataUnit = dataUnitGroup->anyDataUnit();
    const QString text =
        QVStringFromNumberInDisplayRange(value, dataUnit, unitController, true, numberFormatter());
    // A bare number has no unit to stand away from.
    const QString unit = unitController.displayNameForDataUnit(dataUnit, value);
    return QVValueAndUnitParts(text, unit.isEmpty() ? std::nullopt : std::optional(unit), valueFont, unitFont,
                               unitSpacing);
}

StyledText QVQuantityDataUnitValueFormatter::attributedStringFromValue(double value,
                                                                       const VSDataUnitGroup* dataUnitGroup,
                                                                       const VSUnitController& unitController,
                                                                       const QFont& valueFont,
                                                                       const QFont& unitFont) const {
    const auto [number, space, unit] =
        quantityParts(value, dataUnitGroup, unitController, valueFont, unitFont);
    StyledText iconSpace, icon;
    if (const QImage image = unitIcon(dataUnitGroup); !image.isNull()) {
        // Its top is as high above the baseline as the font's ascender is, less the depth of its descender.
        const QFontMetricsF metrics(valueFont);
        iconSpace = StyledText::spacer(iconSpacing);
        icon = StyledText::withImage(
            image, metrics.ascent() - metrics.descent() - image.height() / image.devicePixelRatio());
    }
    return platform::joinWithFormat("QUANTITY_VALUE_FORMAT_STRING", {number, space, unit, iconSpace, icon});
}

StyledText QVHeightDataUnitValueFormatter::attributedStringFromValue(double value,
                                                                     const VSDataUnitGroup* dataUnitGroup,
                                                                     const VSUnitController& unitController,
                                                                     const QFont& valueFont,
                                                                     const QFont& unitFont) const {
    if (!(unitController.unitForDataUnit(dataUnitGroup->anyDataUnit()) == VSUnit::footUnit()))
        return QVQuantityDataUnitValueFormatter::attributedStringFromValue(
            value, dataUnitGroup, unitController, valueFont, unitFont);
    const auto [number, space, unit] =
        QVValueAndUnitParts(QVFeetAndInchesString(value), QString(), valueFont, unitFont, 0);
    return platform::joinWithFormat("QUANTITY_VALUE_FORMAT_STRING",
                                    {number, space, unit, StyledText(), StyledText()});
}

StyledText QVTimePeriodDataUnitValueFormatter::attributedStringFromValue(double value, const VSDataUnitGroup*,
                                                                         const VSUnitController&,
                                                                         const QFont& valueFont,
                                                                         const QFont& unitFont) const {
    const double totalMinutes = std::round(value * 60);
    const double hours = std::trunc(totalMinutes / 60);
    const double minutes = std::fmod(totalMinutes, 60);
    const auto parts = [&](double number, const char* unitKey) {
        auto result = QVValueAndUnitParts(QString(), platform::localized(unitKey), valueFont, unitFont, 0);
        result[0] = wholeNumber(number, valueFont);
        return result;
    };
    std::array<StyledText, 3> hoursParts, minutesParts;
    StyledText separator;
    if (hours > epsilon || minutes <= epsilon) hoursParts = parts(hours, "HOURS_SHORT");
    if (minutes > epsilon) {
        if (hours > epsilon) separator = StyledText(QStringLiteral(" "), valueFont);
        minutesParts = parts(minutes, "MINUTES_SHORT");
    }
    return platform::joinWithFormat("TIME_PERIOD_VALUE_FORMAT_STRING",
                                    {hoursParts[0], hoursParts[1], hoursParts[2], separator, minutesParts[0],
                                     minutesParts[1], minutesParts[2]});
}

StyledText QVQuantityDataPrefixedUnitValueFormatter::attributedStringFromValue(
    double value, const VSDataUnitGroup* dataUnitGroup, const VSUnitController& unitController,
    const QFont& valueFont, const QFont& unitFont) const {
    const auto [number, space, unit] =
        quantityParts(value, dataUnitGroup, unitController, valueFont, unitFont);
    const StyledText separator(platform::localized("PREFIXED_UNIT_SEPARATOR"), unitFont);
    return platform::joinWithFormat("QUANTITY_VALUE_PREFIXED_UNIT_FORMAT_STRING",
                                    {number, space, unit, separator});
}

StyledText QVEnumeratedDataUnitValueFormatter::attributedStringFromValue(double value,
                                                                         const VSDataUnitGroup* dataUnitGroup,
                                                                         const VSUnitController&,
                                                                         const QFont& valueFont,
                                                                         const QFont&) const {
    const auto labels = qv_enumeratedValueLabels(dataUnitGroup);
    const QString* label = qv_labelForNumber(labels, value);
    return StyledText(label ? *label : QVNoDataString(), valueFont);
}

QVValueFormatterClass qv_valueFormatterClass(const VSObjectType* type) {
    const VSTypeCode code = type->code();
    if (code == VSCode::Height) return QVValueFormatterClass::Height;
    if (code == VSCode::SleepAnalysis || code == VSCode::ZentroStandHour || code == VSCode::Workout)
        return QVValueFormatterClass::TimePeriod;
    if (code == VSCode::CervicalMucusQuality || code == VSCode::OvulationTestResult ||
        code == VSCode::MenstrualFlow)
        return QVValueFormatterClass::Enumerated;
    return QVValueFormatterClass::Quantity;
}

std::unique_ptr<QVDataUnitValueFormatter> qv_valueFormatterForUnit(const VSDataUnit* dataUnit,
                                                                   const VSUnit& unit) {
    auto numberFormatter = qv_numberFormatterForUnit(dataUnit, unit);
    switch (qv_valueFormatterClass(dataUnit->dataType())) {
        case QVValueFormatterClass::Height:
            return std::make_unique<QVHeightDataUnitValueFormatter>(std::move(numberFormatter));
        case QVValueFormatterClass::TimePeriod:
            return std::make_unique<QVTimePeriodDataUnitValueFormatter>(std::move(numberFormatter));
        case QVValueFormatterClass::Enumerated:
            return std::make_unique<QVEnumeratedDataUnitValueFormatter>(std::move(numberFormatter));
        case QVValueFormatterClass::Quantity:
            break;
    }
    return std::make_unique<QVQuantityDataUnitValueFormatter>(std::move(numberFormatter));
}
