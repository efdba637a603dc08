// The bounds of charts: round numbers that hold the data without wasting the height.

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <random>

#include "VessaUI/VSDataUnitGroup.h"

namespace {

using Bounds = VSDataUnitGroupChartingRules::Bounds;

const VSDataUnitGroup* named(std::string_view type) {
    return VSDataUnitGroupController::shared().dataUnitGroupForType(VSObjectType::typeForIdentifier(type));
}

Bounds bounds(std::string_view type, double minimum, double maximum, const char* unit) {
    return named(type)->chartingRules().calculateAdjustedBounds(minimum, maximum, VSUnit::fromString(unit));
}

void expectBounds(const Bounds& actual, double minimum, double maximum, int precision) {
    ASSERT_TRUE(actual.minimum && actual.maximum);
    EXPECT_EQ(*actual.minimum, minimum);
    EXPECT_EQ(*actual.maximum, maximum);
    EXPECT_EQ(actual.decimalPrecision, precision);
}

// Written with the promised digits a bound is itself again.
void expectPrintable(double bound, int precision) {
    char text[400];
    std::snprintf(text, sizeof text, "%.*f", precision, bound);
    EXPECT_EQ(std::strtod(text, nullptr), bound) << precision << " digits";
    EXPECT_FALSE(bound == 0 && std::signbit(bound));
}

TEST(ChartBounds, BarsStandOnZeroUnderARoundNumber) {
    expectBounds(bounds("StepCount", 3100, 8463, "count"), 0, 10000, 0);
    expectBounds(bounds("StepCount", 0, 10000, "count"), 0, 10000, 0);
    expectBounds(bounds("StepCount", 12345, 12345, "count"), 0, 12500, 0);
    expectBounds(bounds("DistanceWalkingRunning", 0.2, 0.83, "km"), 0, 1, 1);
    // What is counted in whole numbers is labelled with whole numbers.
    expectBounds(bounds("FlightsClimbed", 1, 1, "count"), 0, 1, 0);
    expectBounds(bounds("FlightsClimbed", 2, 13, "count"), 0, 15, 0);
    expectBounds(bounds("SexualActivity", 0, 0, "count"), 0, 1, 0);
    expectBounds(bounds("SleepAnalysis", 5.1, 8.4, "hr"), 0, 10, 0);
}

TEST(ChartBounds, LinesGetRoomAndDoNotStartAtZero) {
    expectBounds(bounds("BodyMass", 79.4, 82.3, "kg"), 79, 83, 0);
    expectBounds(bounds("BodyTemperature", 36.4, 39.2, "degC"), 36, 40, 0);
    expectBounds(bounds("HeartRate", 48, 162, "count/min"), 25, 175, 0);
    expectBounds(bounds("BloodGlucose", 3.9, 11.2, "mmol<180.1558>/L"), 2, 12, 0);
    // Half and quarter steps are written with their digits, where the unit has so many.
    expectBounds(bounds("BodyTemperature", 36.5, 37.8, "degC"), 36, 38, 1);
    expectBounds(bounds("Height", 1.71, 1.83, "m"), 1.7, 1.85, 2);
    // One value alone stands in the middle of a span that its digits can tell.
    const Bounds one = bounds("BodyMass", 80.3, 80.3, "kg");
    EXPECT_LT(*one.minimum, 80);
    EXPECT_GT(*one.maximum, 80.6);
    EXPECT_GT(*one.minimum, 77);
    EXPECT_LT(*one.maximum, 84);
    // A share ends at 100, and nothing positive begins below 0.
    EXPECT_EQ(bounds("OxygenSaturation", 94, 100, "%").maximum, 100);
    EXPECT_EQ(bounds("BloodAlcoholContent", 0, 0.08, "%").minimum, 0);
    // A day without fever is no mountain range.
    const Bounds flat = bounds("BodyTemperature", 36.6, 36.62, "degC");
    EXPECT_GE(*flat.maximum - *flat.minimum, 0.4);
}

TEST(ChartBounds, WhatIsNotANumberHasNone) {
    constexpr double infinity = std::numeric_limits<double>::infinity(),
                     nan = std::numeric_limits<double>::quiet_NaN();
    for (const auto& [low, high] :
         {std::pair{nan, 1.0}, {0.0, nan}, {nan, nan}, {-infinity, 1.0}, {0.0, infinity}, {2.0, 1.0}}) {
        for (const char* type : {"BodyMass", "StepCount"}) {
            const Bounds none =
                bounds(type, low, high, type == std::string_view("BodyMass") ? "kg" : "count");
            EXPECT_FALSE(none.minimum) << type;
            EXPECT_FALSE(none.maximum) << type;
            EXPECT_EQ(none.decimalPrecision, 0);
        }
    }
}

TEST(ChartBounds, HoldAnyDataAndLeaveItHalfTheHeight) {
    std::mt19937_64 random(20200331);
    std::uniform_real_distribution<double> exponent(-3, 9), sign(0, 1), relativeSpan(0.03, 3);
    for (int i = 0; i < 20000; ++i) {
        const double a = std::pow(10, exponent(random)) * (sign(random) < 0.2 ? -1 : 1);
        const double b = a + std::abs(a) * relativeSpan(random);
        SCOPED_TRACE(std::to_string(a) + " to " + std::to_string(b));

        const Bounds line = bounds("BodyMass", a, b, "kg");
        ASSERT_TRUE(line.minimum && line.maximum);
        EXPECT_LE(*line.minimum, a);
        EXPECT_GE(*line.maximum, b);
        const double told = std::max(b - a, 0.4);  // four tenths of a kilogram is the least span of a line
        EXPECT_LE(*line.maximum - *line.minimum,
                  std::max(2 * told, 2 * 0.02 * std::max(std::abs(a), std::abs(b))) * (1 + 1e-9));
        expectPrintable(*line.minimum, line.decimalPrecision);
        expectPrintable(*line.maximum, line.decimalPrecision);
        // Bounds are good data themselves: bounding them again does not run away.
        const Bounds again = bounds("BodyMass", *line.minimum, *line.maximum, "kg");
        EXPECT_LE(*again.maximum - *again.minimum, 2 * (*line.maximum - *line.minimum));

        if (a < 0) continue;
        const Bounds bars = bounds("DistanceWalkingRunning", a, b, "km");
        EXPECT_EQ(bars.minimum, 0);
        EXPECT_GE(*bars.maximum, b);
        EXPECT_LE(*bars.maximum, 1.5 * b);
        expectPrintable(*bars.maximum, bars.decimalPrecision);
        EXPECT_EQ(bounds("DistanceWalkingRunning", 0, *bars.maximum, "km").maximum, bars.maximum);
    }
}

TEST(ChartBounds, TakeTheSmallestAndTheGreatest) {
    for (const double value : {5e-324, 1e-300, 1e-12, 1e-6, 1e15, 1e300}) {
        SCOPED_TRACE(value);
        const Bounds line = bounds("BodyMass", value, value, "kg");
        EXPECT_LE(*line.minimum, value);
        EXPECT_GT(*line.maximum, value);
        EXPECT_EQ(std::isfinite(*line.maximum - *line.minimum), true);
        const Bounds bars = bounds("DistanceWalkingRunning", 0, value, "km");
        EXPECT_EQ(bars.minimum, 0);
        EXPECT_GE(*bars.maximum, value);
        EXPECT_TRUE(std::isfinite(*bars.maximum));
    }
    const Bounds cold = bounds("BodyTemperature", -12.3, -4.1, "degC");
    EXPECT_LE(*cold.minimum, -12.3);
    EXPECT_GE(*cold.maximum, -4.1);
    EXPECT_LE(*cold.maximum, 0);
}

}  // namespace
