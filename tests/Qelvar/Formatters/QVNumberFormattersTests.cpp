#include "Qelvar/Formatters/QVNumberFormatters.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <limits>

#include "FormattersFixture.h"
#include "Qelvar/Formatters/QVDataUnitGroupLabels.h"

namespace {

TEST(QVDecimalNumberFormatter, FollowsTheLocaleAtEachCall) {
    const auto two = QVNumberFormatterWithFractionDigits(2);
    EXPECT_EQ(two, QVNumberFormatterWithFractionDigits(2));
    const auto text = [&](const char* locale) {
        test::FixedEnvironment environment("2020-03-31T20:00", "Europe/Copenhagen", locale);
        return two->stringFromNumber(-1234567.891).toStdString();
    };
    EXPECT_EQ(text("en_US"), "-1,234,567.89");
    EXPECT_EQ(text("de_DE"), "-1.234.567,89");
    EXPECT_EQ(text("hi_IN"), "-12,34,567.89");
    EXPECT_EQ(text("hi_IN@numbers=deva"), "-१२,३४,५६७.८९");
    EXPECT_EQ(text("ar_EG"), "\u061C-١٬٢٣٤٬٥٦٧٫٨٩");
    EXPECT_EQ(text("en_US"), "-1,234,567.89");
}

TEST(QVDecimalNumberFormatter, RoundsHalfToEvenAndShowsNoNeedlessDigits) {
    test::FixedEnvironment environment;
    const auto text = [](double number, int digits) {
        return QVNumberFormatterWithFractionDigits(digits)->stringFromNumber(number).toStdString();
    };
    const std::tuple<double, int, const char*> cases[] = {
        {72, 2, "72"},      {72.5, 2, "72.5"},
        {72.4999, 0, "72"}, {0.5, 0, "0"},
        {1.5, 0, "2"},      {2.5, 0, "2"},
        {0.125, 2, "0.12"}, {98.60000000000001, 4, "98.6"},
        {-0.001, 2, "0"},   {1e15, 0, "1,000,000,000,000,000"}};
    for (const auto& [number, digits, expected] : cases) EXPECT_EQ(text(number, digits), expected);
    EXPECT_EQ(text(std::numeric_limits<double>::quiet_NaN(), 0), "NaN");
}

class QVNumberFormattersTest : public test::FormattersTest {
 protected:
    std::string timePeriod(double hours, bool round = false) const {
        return QVTimePeriodNumberFormatter(round)
            .stringFromNumber(hours, nullptr, *units_)
            .value()
            .toStdString();
    }
};

TEST_F(QVNumberFormattersTest, TimePeriodsAreCutToMinutes) {
    const std::pair<double, const char*> cut[] = {{0, "0 hr"},          {0.25, "15 min"},
                                                  {7.5, "7 hr 30 min"}, {1.999, "1 hr 59 min"},
                                                  {2, "2 hr"},          {1234, "1,234 hr"}},
                                         rounded[] = {{7.49, "7 hr"}, {7.5, "8 hr"}, {0.2, "0 hr"}};
    for (const auto& [hours, expected] : cut) EXPECT_EQ(timePeriod(hours), expected);
    for (const auto& [hours, expected] : rounded) EXPECT_EQ(timePeriod(hours, true), expected);
    for (int minutes = 61; minutes < 600; ++minutes) {
        const std::string rest = minutes % 60 ? " " + std::to_string(minutes % 60) + " min" : "";
        EXPECT_EQ(timePeriod(minutes / 60.0), std::to_string(minutes / 60) + " hr" + rest);
    }
}

TEST_F(QVNumberFormattersTest, FeetAndInchesCarryIntoTheFeet) {
    const auto text = [](double feet) { return QVFeetAndInchesString(feet).toStdString(); };
    EXPECT_EQ(text(6), "6 ft 0 in");
    EXPECT_EQ(text(5.5), "5 ft 6 in");
    EXPECT_EQ(text(5.9999), "6 ft 0 in");
    EXPECT_EQ(text(5.999), "5 ft 11.99 in");
    EXPECT_EQ(text(5.0 + 11.0 / 12), "5 ft 11 in");
    EXPECT_EQ(text(0), "0 ft 0 in");
    test::FixedEnvironment arabic("2020-03-31T20:00", "Africa/Cairo", "ar_EG");
    EXPECT_EQ(text(5.5), "٥ قدم ٦ بوصة");
}

TEST_F(QVNumberFormattersTest, OthersGetTheFractionDigitsOfTheirUnit) {
    const VSDataUnit* weight = groupForType(VSCode::BodyMass)->anyDataUnit();
    const VSUnit unit = units_->unitForDataUnit(weight);
    const int digits = weight->dataUnitGroup()->chartingRules().allowedDecimalPrecisionForUnit(unit);
    EXPECT_EQ(qv_numberFormatterForUnit(weight, unit)->stringFromNumber(70.123456789, weight, *units_),
              QVNumberFormatterWithFractionDigits(digits)->stringFromNumber(70.123456789));
    EXPECT_EQ(qv_numberFormatterForUnit(group(VSGroupID::Steps)->anyDataUnit(), VSUnit::countUnit())
                  ->stringFromNumber(1234.6, nullptr, *units_),
              "1,235");
}

TEST_F(QVNumberFormattersTest, EveryDisplayRangeHoldsItsBoundsAndCutsWhatIsBeyond) {
    int ranges = 0;
    for (const auto* type : VSDataUnitGroupController::shared().allDataUnitGroups()) {
        if (type->isCharacteristic()) continue;
        const VSDataUnit* unit = type->anyDataUnit();
        const auto range = units_->displayRangeForDataUnit(unit);
        const auto text = [&](double number, bool clamp) {
            return QVStringFromNumberInDisplayRange(number, unit, *units_, clamp);
        };
        if (range && range->maximum) {
            ++ranges;
            const double above = std::nextafter(*range->maximum, 1e300);
            EXPECT_EQ(text(*range->maximum, true), text(*range->maximum, false))
                << type->displayName().toStdString();
            EXPECT_EQ(text(above, true), ">" + text(*range->maximum, false))
                << type->displayName().toStdString();
            EXPECT_EQ(text(above, false), text(*range->maximum, false)) << type->displayName().toStdString();
        }
        if (range && range->minimum) {
            EXPECT_EQ(text(*range->minimum, true), text(*range->minimum, false))
                << type->displayName().toStdString();
            EXPECT_EQ(text(std::nextafter(*range->minimum, -1e300), true), "<" + text(*range->minimum, false))
                << type->displayName().toStdString();
        }
    }
    EXPECT_GT(ranges, 5);
}

TEST_F(QVNumberFormattersTest, ChartBoundsUseTheDefaultFormatterUnlessTheTypeHasItsOwn) {
    const auto four = QVNumberFormatterWithFractionDigits(4);
    const auto bound = [&](int id, double value, QVTimeScope timeScope = QVTimeScope::Week) {
        return qv_dashboardChartBoundStringFromValue(group(id), timeScope, value, *four, *units_)
            .toStdString();
    };
    EXPECT_EQ(bound(VSGroupID::Steps, 800'000, QVTimeScope::Year), "800,000/mo");
    EXPECT_EQ(bound(VSGroupID::Steps, 0, QVTimeScope::Year), "0");
    EXPECT_EQ(bound(VSGroupID::Steps, 1500, QVTimeScope::Day), "1,500/hr");
    EXPECT_EQ(bound(VSGroupID::Workouts, 40, QVTimeScope::Year), "40 hr/mo");
    EXPECT_EQ(bound(VSGroupID::HeartRate, 90, QVTimeScope::Year), "90") << "no total";
    EXPECT_EQ(bound(VSGroupID::Steps, 1234.5678), "1,234.5678");
    EXPECT_EQ(bound(VSGroupID::SleepAnalysis, 7.5), "7 hr 30 min");
    const auto range = units_->displayRangeForDataUnit(group(VSGroupID::HeartRate)->anyDataUnit());
    ASSERT_TRUE(range && range->maximum);
    EXPECT_EQ(bound(VSGroupID::HeartRate, *range->maximum + 1),
              ">" + four->stringFromNumber(*range->maximum).toStdString());
}

TEST_F(QVNumberFormattersTest, AnAmountThatIsThereIsNeverNone) {
    const auto text = [&](int id, double value) {
        const VSDataUnit* unit = group(id)->anyDataUnit();
        return (QVStringFromNumberInDisplayRange(value, unit, *units_, true) + " " +
                units_->displayNameForDataUnit(unit, value))
            .toStdString();
    };
    EXPECT_EQ(text(VSGroupID::FlightsClimbed, 0), "0 floors");
    EXPECT_EQ(text(VSGroupID::FlightsClimbed, 0.08), "<1 floor");
    EXPECT_EQ(text(VSGroupID::FlightsClimbed, 0.5), "<1 floor");
    EXPECT_EQ(text(VSGroupID::FlightsClimbed, 0.92), "1 floor");
    EXPECT_EQ(text(VSGroupID::WalkingRunningDistance, 0.001), "<0.01 mi");
}

TEST_F(QVNumberFormattersTest, EnumeratedLabels) {
    EXPECT_EQ(qv_enumeratedValueLabels(group(VSGroupID::SleepAnalysis)),
              (std::map<int, QString>{{0, "In Bed"}, {1, "Asleep"}}));
    EXPECT_EQ(qv_displayNameForEnumValue(group(VSGroupID::OvulationTestResult), 3), "Indeterminate");
    EXPECT_EQ(qv_displayNameForEnumValue(group(VSGroupID::MenstrualFlow), 0), std::nullopt);
    EXPECT_EQ(qv_displayNameForEnumValue(group(VSGroupID::Workouts), 58), std::nullopt);
    EXPECT_EQ(qv_displayNameForEnumValue(group(VSGroupID::Workouts), 3000), "Other");
    for (int activity = 1; activity <= 57; ++activity) {
        const auto name = qv_displayNameForEnumValue(group(VSGroupID::Workouts), activity);
        ASSERT_TRUE(name) << activity;
        EXPECT_FALSE(name->startsWith("VSWorkoutActivityType")) << name->toStdString();
    }
    EXPECT_TRUE(qv_enumeratedValueLabels(group(VSGroupID::Steps)).empty());

    const QVEnumeratedDataUnitNumberFormatter formatter(group(VSGroupID::CervicalMucusQuality));
    EXPECT_EQ(formatter.stringFromNumber(2.7, nullptr, *units_), "Sticky");
    EXPECT_EQ(formatter.stringFromNumber(6, nullptr, *units_), std::nullopt);
}

TEST_F(QVNumberFormattersTest, EveryStackedValueHasALabelAndEveryLabelItsPlace) {
    for (const auto* type : VSDataUnitGroupController::shared().allDataUnitGroups()) {
        const auto labels = qv_enumeratedValueLabels(type);
        auto order = qv_valueOrderForStackedCharts(type);
        if (labels.empty()) {
            EXPECT_EQ(order, std::vector<int>{0});
        } else {
            std::sort(order.begin(), order.end());
            std::vector<int> values;
            for (const auto& [value, label] : labels) values.push_back(value);
            EXPECT_EQ(order, values) << type->displayName().toStdString();
        }
        const int id = type->dataUnitGroupID();
        EXPECT_EQ(qv_interactiveChartsDataSourceDependsOnTimeScope(type), id == 58 || id == 72 || id == 75)
            << id;
        const bool oneLine = type->chartingRules().chartStyleForTimeScope(1) == VSChartStyle::CenteredLine;
        EXPECT_EQ(qv_stackedChartSectionsCount(type),
                  oneLine || labels.empty() ? 1 : static_cast<int>(labels.size()));
    }
    EXPECT_EQ(qv_valueOrderForStackedCharts(group(VSGroupID::OvulationTestResult)), (std::vector{2, 1, 3}));
    EXPECT_EQ(qv_valueOrderForStackedCharts(group(VSGroupID::StandHours)), (std::vector{1, 0}));
}

}  // namespace
