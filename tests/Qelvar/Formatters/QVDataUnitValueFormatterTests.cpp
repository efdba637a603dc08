#include "Qelvar/Formatters/QVDataUnitValueFormatter.h"

#include <gtest/gtest.h>

#include <QFontMetricsF>
#include <limits>

#include "FormattersFixture.h"
#include "Qelvar/Formatters/QVNumberFormatters.h"

namespace {

using platform::StyledText;

class QVDataUnitValueFormatterTest : public test::FormattersTest {
 protected:
    StyledText styled(const VSDataUnitGroup* type, double value) const {
        const VSDataUnit* unit = type->anyDataUnit();
        return qv_valueFormatterForUnit(unit, units_->unitForDataUnit(unit))
            ->attributedStringFromValue(value, type, *units_, valueFont_, unitFont_);
    }
    std::string plain(const VSDataUnitGroup* type, double value) const {
        const VSDataUnit* unit = type->anyDataUnit();
        return qv_valueFormatterForUnit(unit, units_->unitForDataUnit(unit))
            ->stringFromValue(value, type, *units_)
            .toStdString();
    }
    const QFont valueFont_ = platform::systemFont(19), unitFont_ = platform::systemFont(15);
};

TEST_F(QVDataUnitValueFormatterTest, ClassesByDataType) {
    for (const auto* type : VSObjectType::allTypes()) {
        const int code = VSTypeCodeValue(type->code());
        const bool period = code == 63 || code == 70 || code == 79;
        EXPECT_EQ(qv_valueFormatterClass(type), code == 2 ? QVValueFormatterClass::Height
                                                : period  ? QVValueFormatterClass::TimePeriod
                                                : code == 91 || code == 92 || code == 95
                                                    ? QVValueFormatterClass::Enumerated
                                                    : QVValueFormatterClass::Quantity)
            << code;
        const auto number = qv_numberFormatterForUnit(type, VSUnit::hourUnit());
        EXPECT_EQ(number != nullptr, code == 2 || period) << code;
        const auto* hours = dynamic_cast<const QVTimePeriodNumberFormatter*>(number.get());
        EXPECT_EQ(hours != nullptr, period) << code;
        EXPECT_EQ(hours && hours->shouldRoundToHours(), code == 70) << code;
    }
}

TEST_F(QVDataUnitValueFormatterTest, QuantityIsValueSpaceUnitInTheirFonts) {
    const auto* heartRate = group(VSGroupID::HeartRate);
    const QString unit = units_->displayNameForDataUnit(heartRate->anyDataUnit(), 72);
    const StyledText text = styled(heartRate, 72);
    ASSERT_EQ(text.runs().size(), 3u);
    EXPECT_EQ(text.runs()[0].text, "72");
    EXPECT_EQ(text.runs()[0].font, valueFont_);
    EXPECT_EQ(text.runs()[1].spacing, 2);
    EXPECT_EQ(text.runs()[2].text, unit);
    EXPECT_EQ(text.runs()[2].font, unitFont_);
    EXPECT_EQ(plain(heartRate, 72), "72" + unit.toStdString());
    const QVQuantityDataPrefixedUnitValueFormatter prefixed(nullptr);
    EXPECT_EQ(prefixed.stringFromValue(72, heartRate, *units_), unit + ": 72");
    const auto range = units_->displayRangeForDataUnit(heartRate->anyDataUnit());
    ASSERT_TRUE(range && range->maximum);
    EXPECT_EQ(styled(heartRate, *range->maximum + 1).runs()[0].text.left(1), ">");
}

TEST_F(QVDataUnitValueFormatterTest, UnitIconStandsAfterTheUnit) {
    const auto* fuel = groupForType(VSCode::NikeFuel);
    ASSERT_FALSE(fuel->unitIcon().isEmpty());
    const StyledText text = styled(fuel, 2000);
    ASSERT_EQ(text.runs().size(), 3u) << "no space before a unit that has no name";
    EXPECT_EQ(text.runs()[1].spacing, 1);
    const auto& icon = text.runs().back();
    ASSERT_FALSE(icon.image.isNull());
    const QFontMetricsF metrics(valueFont_);
    const double height = icon.image.height() / icon.image.devicePixelRatio();
    EXPECT_DOUBLE_EQ(icon.baselineOffset, metrics.ascent() - metrics.descent() - height);
}

TEST_F(QVDataUnitValueFormatterTest, HeightInFeetHasItsUnitsInside) {
    const auto* height = group(VSGroupID::Height);
    setUnit(height, "ft");
    EXPECT_EQ(styled(height, 5.5).runs().size(), 1u);
    EXPECT_EQ(plain(height, 5.5), "5 ft 6 in");
    EXPECT_EQ(plain(height, 5.9999), "6 ft 0 in");
    setUnit(height, "cm");
    EXPECT_EQ(styled(height, 180.126).runs().size(), 3u);
    EXPECT_EQ(plain(height, 180.126).substr(0, 6), "180.13");
}

TEST_F(QVDataUnitValueFormatterTest, TimePeriodsAreRoundedToMinutes) {
    const auto* sleep = group(VSGroupID::SleepAnalysis);
    EXPECT_EQ(plain(sleep, 1.999), "2 hr");
    EXPECT_EQ(plain(sleep, 0.5), "30 min");
    EXPECT_EQ(plain(sleep, 0), "0 hr");
    EXPECT_EQ(plain(sleep, 7.5), "7 hr 30 min");
    EXPECT_EQ(plain(sleep, 0.4999 / 60), "0 hr");
    EXPECT_EQ(plain(sleep, 0.5 / 60), "1 min");
    const StyledText text = styled(sleep, 7.5);
    ASSERT_EQ(text.runs().size(), 5u);
    EXPECT_EQ(text.runs()[0].font, valueFont_);
    EXPECT_EQ(text.runs()[1].font, unitFont_);
    EXPECT_EQ(text.runs()[3].font, valueFont_);
}

TEST_F(QVDataUnitValueFormatterTest, EnumeratedValuesAreLabelsOrNoData) {
    const auto* mucus = group(VSGroupID::CervicalMucusQuality);
    EXPECT_EQ(plain(mucus, 2.7), "Sticky");
    for (const double unknown : {9.0, 1e300, std::numeric_limits<double>::quiet_NaN()})
        EXPECT_EQ(plain(mucus, unknown), "No Data");
    ASSERT_EQ(styled(mucus, 5).runs().size(), 1u);
    EXPECT_EQ(styled(mucus, 5).runs()[0].font, valueFont_);
}

TEST(QVValueAndUnitParts, SpaceOnlyBeforeAUnit) {
    const QFont font = platform::systemFont(10);
    const auto without = QVValueAndUnitParts("5", std::nullopt, font, font, 2);
    EXPECT_TRUE(without[1].isEmpty());
    EXPECT_TRUE(without[2].isEmpty());
    EXPECT_TRUE(QVValueAndUnitParts("5", "kg", font, font, 0)[1].isEmpty());
    EXPECT_EQ(QVValueAndUnitParts("5", "kg", font, font, 2)[1], StyledText::spacer(2));
}

}  // namespace
