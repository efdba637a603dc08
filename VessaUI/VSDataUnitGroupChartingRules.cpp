#include "VessaUI/VSDataUnitGroupChartingRules.h"

#include <algorithm>
#include <cmath>

namespace {

constexpr int fallbackPrecision = 2;  // of a unit that the display type does not offer

size_t index(VSTimeScopeIndex timeScope) {
    return timeScope >= 0 && timeScope < 5 ? static_cast<size_t>(timeScope) : 0;
}

// A round number m * 10^exponent, kept in two whole parts so that its multiples come out as the doubles
// nearest to their decimal texts.
struct RoundStep {
    double mantissa = 1;  // 1, 2, 2.5 or 5
    int exponent = 0;

    double value() const { return multiple(1); }
    double multiple(double count) const {
        return exponent >= 0 ? count * mantissa * std::pow(10.0, exponent)
                             : count * mantissa / std::pow(10.0, -exponent);
    }
    int fractionDigits() const { return std::max(0, -exponent + (mantissa == 2.5 ? 1 : 0)); }
};

/// The least round step not below `target` > 0. 2.5 is used only where its digits are shown in the unit
/// anyway.
RoundStep roundStepNotBelow(double target, int precision) {
    RoundStep step{1, static_cast<int>(std::floor(std::log10(target))) - 1};
    while (true) {
        for (const double mantissa : {1.0, 2.0, 2.5, 5.0}) {
            step.mantissa = mantissa;
            if (mantissa == 2.5 && step.fractionDigits() > precision) continue;
            if (step.value() >= target) return step;
        }
        step.exponent += 1;
    }
}

double multipleNotAbove(const RoundStep& step, double value) {
    double count = std::floor(value / step.value());
    while (step.multiple(count) > value) count -= 1;
    return step.multiple(count);
}

double multipleNotBelow(const RoundStep& step, double value) {
    double count = std::ceil(value / step.value());
    while (step.multiple(count) < value) count += 1;
    return step.multiple(count);
}

// A step of at least a sixth of the data's span: at most two of them are added, so that the data keep half
// the height of the chart or more.
constexpr double stepsInSpan = 6;
// The share of the span that stays free above and below a line, for its markers.
constexpr double room = 0.04;
// A line through data that hardly differ would be drawn as a mountain range: it spans at least this share
// of the value, and this many of the last digits shown.
constexpr double leastRelativeSpan = 0.02;
constexpr double leastSpanInLastDigits = 4;
// What lies nearer to zero is zero, in every unit on offer.
constexpr double negligible = 1e-9;

}  // namespace

VSDateComponents VSDataUnitGroupChartingRules::intervalComponentsForTimeScope(
    VSTimeScopeIndex timeScope) const {
    return intervals_[index(timeScope)];
}

VSChartStyle VSDataUnitGroupChartingRules::chartStyleForTimeScope(VSTimeScopeIndex timeScope) const {
    return styles_[index(timeScope)];
}

VSChartStyle VSDataUnitGroupChartingRules::defaultChartStyle() const {
    return defaultStyle_;
}

double VSDataUnitGroupChartingRules::chartPointRadiusForTimeScope(VSTimeScopeIndex timeScope) const {
    return pointRadius_[index(timeScope)];
}

double VSDataUnitGroupChartingRules::chartPointLineWidthForTimeScope(VSTimeScopeIndex timeScope) const {
    return pointLineWidth_[index(timeScope)];
}

int VSDataUnitGroupChartingRules::allowedDecimalPrecisionForUnit(const VSUnit& unit) const {
    for (const auto& [offered, precision] : precisions_)
        if (offered == unit) return precision;
    return fallbackPrecision;
}

VSDataUnitGroupChartingRules::Bounds VSDataUnitGroupChartingRules::calculateAdjustedBounds(
    double minimum, double maximum, const VSUnit& unit) const {
    // Half the range of doubles, so that no difference of two of them overflows.
    constexpr double greatest = 1e300;
    if (!(std::abs(minimum) <= greatest && std::abs(maximum) <= greatest) || minimum > maximum) return {};
    const int precision = allowedDecimalPrecisionForUnit(unit);
    const bool standsOnZero = defaultStyle_ != VSChartStyle::Line && defaultStyle_ != VSChartStyle::Points &&
                              defaultStyle_ != VSChartStyle::MinMax;
    return standsOnZero ? boundsFromZero(maximum, precision) : boundsAround(minimum, maximum, precision);
}

VSDataUnitGroupChartingRules::Bounds VSDataUnitGroupChartingRules::boundsFromZero(double maximum,
                                                                                  int precision) const {
    // Nothing counted: an empty chart that reaches one step up.
    if (maximum < negligible) return {.minimum = 0, .maximum = 1, .decimalPrecision = 0};
    double target = maximum / stepsInSpan;
    if (precision == 0) target = std::max(target, 1.0);
    const RoundStep step = roundStepNotBelow(target, precision);
    return {
        .minimum = 0, .maximum = multipleNotBelow(step, maximum), .decimalPrecision = step.fractionDigits()};
}

VSDataUnitGroupChartingRules::Bounds VSDataUnitGroupChartingRules::boundsAround(double minimum,
                                                                                double maximum,
                                                                                int precision) const {
    const double magnitude = std::max(std::abs(minimum), std::abs(maximum));
    const double leastSpan =
        std::max(leastRelativeSpan * magnitude, leastSpanInLastDigits * std::pow(10.0, -precision));
    const double missing = std::max(0.0, leastSpan - (maximum - minimum)) / 2;
    const double margin = std::max(room * (maximum - minimum), missing);
    double low = minimum - margin;
    double high = maximum + margin;
    const RoundStep step = roundStepNotBelow((high - low) / stepsInSpan, precision);
    low = multipleNotAbove(step, low);
    high = multipleNotBelow(step, high);
    // Room is not taken beyond what a value can be: nothing weighs less than nothing.
    if (minimum >= 0) low = std::max(low, 0.0);
    if (maximum <= 0) high = std::min(high, 0.0);
    if (ceiling_ && maximum <= *ceiling_) high = std::min(high, *ceiling_);
    // Adding zero makes a negative zero, which would be written with its sign, positive.
    return {.minimum = low + 0.0, .maximum = high + 0.0, .decimalPrecision = step.fractionDigits()};
}
