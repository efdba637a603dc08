#include "Qelvar/Formatters/QVNumberFormatters.h"

#include <unicode/numberformatter.h>

#include <cmath>
#include <limits>
#include <mutex>
#include <optional>
#include <utility>

#include "Platform/Localization.h"
#include "Qelvar/Formatters/QVDataUnitGroupLabels.h"
#include "Vessa/Base/VSEnvironment.h"

namespace {

using platform::localized;

// ICU's formatters cost milliseconds to make; they are immutable and shared.
std::shared_ptr<const icu::number::LocalizedNumberFormatter> icuFormatter(const std::string& locale,
                                                                          int fractionDigits) {
    static std::mutex mutex;
    static std::map<std::pair<std::string, int>, std::shared_ptr<const icu::number::LocalizedNumberFormatter>>
        formatters;  // guarded by mutex
    std::lock_guard lock(mutex);
    auto& formatter = formatters[{locale, fractionDigits}];
    if (!formatter) {
        formatter = std::make_shared<const icu::number::LocalizedNumberFormatter>(
            icu::number::NumberFormatter::withLocale(icu::Locale(locale.c_str()))
                .precision(icu::number::Precision::minMaxFraction(0, fractionDigits))
                .roundingMode(UNUM_ROUND_HALFEVEN)
                // What rounds to zero is zero, without a minus.
                .sign(UNUM_SIGN_NEGATIVE));
    }
    return formatter;
}

constexpr double epsilon = std::numeric_limits<double>::epsilon();
constexpr double nearAMinute = 1e-6;  // in minutes; records are kept to the microsecond

QString wholeNumber(double number) {
    return QVNumberFormatterWithFractionDigits(0)->stringFromNumber(number);
}

}  // namespace

QString QVDecimalNumberFormatter::stringFromNumber(double number) const {
    UErrorCode status = U_ZERO_ERROR;
    const auto formatter = icuFormatter(VSEnvironment::current()->localeIdentifier(), maximumFractionDigits_);
    const icu::UnicodeString text = formatter->formatDouble(number, status).toString(status);
    if (U_FAILURE(status)) return QString::number(number, 'f', maximumFractionDigits_);
    return QString::fromUtf16(text.getBuffer(), text.length());
}

std::optional<QString> QVDecimalNumberFormatter::stringFromNumber(double number, const VSDataUnit*,
                                                                  const VSUnitController&) const {
    return stringFromNumber(number);
}

std::shared_ptr<const QVDecimalNumberFormatter> QVNumberFormatterWithFractionDigits(int fractionDigits) {
    static std::mutex mutex;
    static std::map<int, std::shared_ptr<const QVDecimalNumberFormatter>> formatters;  // guarded by mutex
    std::lock_guard lock(mutex);
    auto& formatter = formatters[fractionDigits];
    if (!formatter) formatter = std::make_shared<const QVDecimalNumberFormatter>(fractionDigits);
    return formatter;
}

std::optional<QString> QVTimePeriodNumberFormatter::stringFromNumber(double number, const VSDataUnit*,
                                                                     const VSUnitController&) const {
    // An hour and a minute is a little less than that as a double: what lies so near to a minute is it.
    const double wholeMinutes = std::trunc(number * 60 + std::copysign(nearAMinute, number));
    double hours = std::trunc(wholeMinutes / 60);
    double minutes = wholeMinutes - hours * 60;
    if (shouldRoundToHours_) {
        if (minutes > 29) hours += 1;
        minutes = 0;
    }
    QString hoursText, hoursUnit, separator, minutesText, minutesUnit;
    if (minutes <= epsilon || hours > epsilon) {
        hoursText = wholeNumber(hours);
        hoursUnit = localized("HOURS_SHORT");
    }
    if (minutes > epsilon) {
        if (hours > epsilon) separator = QStringLiteral(" ");
        minutesText = wholeNumber(minutes);
        minutesUnit = localized("MINUTES_SHORT");
    }
    return localized("TIME_PERIOD_AVERAGE_FORMAT_STRING",
                     {hoursText, hoursUnit, separator, minutesText, minutesUnit});
}

std::optional<QString> QVHeightNumberFormatter::stringFromNumber(
    double number, const VSDataUnit* dataUnit, const VSUnitController& unitController) const {
    if (unitController.unitForDataUnit(dataUnit) == VSUnit::footUnit()) return QVFeetAndInchesString(number);
    return QVNumberFormatterWithFractionDigits(2)->stringFromNumber(number);
}

QVEnumeratedDataUnitNumberFormatter::QVEnumeratedDataUnitNumberFormatter(const VSDataUnitGroup* group)
    : valueLabels_(qv_enumeratedValueLabels(group)) {}

std::optional<QString> QVEnumeratedDataUnitNumberFormatter::stringFromNumber(double number, const VSDataUnit*,
                                                                             const VSUnitController&) const {
    const QString* label = qv_labelForNumber(valueLabels_, number);
    if (!label) return std::nullopt;
    return *label;
}

std::shared_ptr<const VSNumberFormatter> qv_numberFormatterForUnit(const VSObjectType* type, const VSUnit&) {
    static const auto height = std::make_shared<const QVHeightNumberFormatter>();
    static const auto timePeriod = std::make_shared<const QVTimePeriodNumberFormatter>(false);
    static const auto wholeHours = std::make_shared<const QVTimePeriodNumberFormatter>(true);
    const VSTypeCode code = type->code();
    if (code == VSCode::Height) return height;
    if (code == VSCode::SleepAnalysis || code == VSCode::Workout) return timePeriod;
    if (code == VSCode::ZentroStandHour) return wholeHours;
    return nullptr;
}

std::shared_ptr<const VSNumberFormatter> qv_numberFormatterForUnit(const VSDataUnit* dataUnit,
                                                                   const VSUnit& unit) {
    if (auto own = qv_numberFormatterForUnit(dataUnit->dataType(), unit)) return own;
    return QVNumberFormatterWithFractionDigits(
        dataUnit->dataUnitGroup()->chartingRules().allowedDecimalPrecisionForUnit(unit));
}

QString QVStringFromNumberInDisplayRange(double number, const VSDataUnit* dataUnit,
                                         const VSUnitController& unitController, bool clampToDisplayRange,
                                         const VSNumberFormatter* numberFormatter) {
    std::shared_ptr<const VSNumberFormatter> own;
    if (!numberFormatter) {
        own = qv_numberFormatterForUnit(dataUnit, unitController.unitForDataUnit(dataUnit));
        numberFormatter = own.get();
    }
    const auto text = [&](double value) {
        return numberFormatter->stringFromNumber(value, dataUnit, unitController).value_or(QString());
    };
    const auto range = clampToDisplayRange ? unitController.displayRangeForDataUnit(dataUnit) : std::nullopt;
    if (range && range->maximum && number > *range->maximum)
        return localized("GREATER_THAN_%@", {text(*range->maximum)});
    if (range && range->minimum && number < *range->minimum)
        return localized("LESS_THAN_%@", {text(*range->minimum)});
    const auto* decimal = dynamic_cast<const QVDecimalNumberFormatter*>(numberFormatter);
    if (decimal && number > 0 && dataUnit->dataType()->isCumulative() && text(number) == text(0))
        return localized("LESS_THAN_%@", {text(std::pow(10, -decimal->maximumFractionDigits()))});
    return text(number);
}

QString QVFeetAndInchesString(double number) {
    double feet = std::floor(number);
    const double inches = (number - feet) * 12;
    double hundredths = std::round(inches * 100);
    if (hundredths >= 1200) {
        feet += 1;
        hundredths -= 1200;
    }
    const QString inchesText = std::fmod(hundredths, 100) == 0
                                   ? wholeNumber(hundredths / 100)
                                   : QVNumberFormatterWithFractionDigits(2)->stringFromNumber(
                                         static_cast<double>(static_cast<float>(inches)));
    return localized("FEET_INCH_FORMAT %@ %@", {wholeNumber(feet), inchesText});
}

QString QVNoDataString() {
    return localized("NO_DATA");
}

QString QVValueUnitString(const QString& value, const QString& unit) {
    return localized("VALUE_UNIT_FORMAT %@ %@", {value, unit});
}
