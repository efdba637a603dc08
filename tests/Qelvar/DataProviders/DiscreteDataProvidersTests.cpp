#include <cmath>
#include <random>

#include "ProviderTestSupport.h"
#include "Qelvar/DataProviders/QVBasalBodyTemperatureDataProvider.h"
#include "Qelvar/DataProviders/QVDataUnitGroupDataProviders.h"
#include "Qelvar/DataProviders/QVDiscreteAverageDataProvider.h"
#include "Qelvar/DataProviders/QVDiscreteMinMaxDataProvider.h"

using namespace test;

namespace {

class DiscreteTest : public ProviderTest {
 protected:
    const VSDataUnitGroup* bodyMass =
        VSDataUnitGroupController::shared().dataUnitGroupForType(type(VSCode::BodyMass));

    void SetUp() override {
        unitController->updatePreferredUnit(VSUnit::fromString("kg"), bodyMass->anyDataUnit());
    }
    VSSamplePtr weight(double kg, const std::string& at) { return reading(VSCode::BodyMass, kg, "kg", at); }
    VSSamplePtr pulse(double rate, const std::string& at) {
        return reading(VSCode::HeartRate, rate, "count/min", at);
    }
    std::shared_ptr<QVDiscreteAverageDataProvider> makeWeight() {
        return provider<QVDiscreteAverageDataProvider>(bodyMass->dataUnitGroupID());
    }
};

double minOf(const QVChartPointPtr& point) {
    return point->yValueForKey("min").value_or(NAN);
}
double maxOf(const QVChartPointPtr& point) {
    return point->yValueForKey("max").value_or(NAN);
}

}  // namespace

TEST_F(DiscreteTest, AveragesOfDaysThatHaveReadings) {
    save({weight(70, "2020-03-09T07:00"), weight(71, "2020-03-09T21:00"), weight(72, "2020-03-12T07:00"),
          weight(90, "2020-03-07T07:00")});
    auto provider = makeWeight();
    show(*provider, QVTimeScope::Week);
    ASSERT_TRUE(waitUntilLoaded(*provider));
    EXPECT_EQ(yValues(*provider), (std::vector<std::optional<double>>{70.5, 72}));
    EXPECT_EQ(provider->historicalData()[0]->xValue(), date("2020-03-09T12:00"));
    // Of readings, not of days.
    EXPECT_DOUBLE_EQ(*provider->averageValue(), 71);
    ASSERT_TRUE(waitUntil([&] { return provider->hasLoadedCurrentValue(); }));
    EXPECT_EQ(provider->currentValue(), 72);
    EXPECT_EQ(provider->lastUpdatedDate(), date("2020-03-12T07:00"));
}

TEST_F(DiscreteTest, TheTrailingPeriodOfEachScope) {
    // One reading on each side of each border.
    save({weight(1, "2019-03-31T23:59"), weight(2, "2019-04-01T00:00"), weight(4, "2020-02-12T23:59"),
          weight(8, "2020-02-13T00:00"), weight(16, "2020-03-07T23:59"), weight(32, "2020-03-08T00:00"),
          weight(64, "2020-03-14T08:00")});
    auto provider = makeWeight();
    const std::pair<QVTimeScope, double> expected[] = {{QVTimeScope::Day, (32 + 64) / 2.0},
                                                       {QVTimeScope::Week, (32 + 64) / 2.0},
                                                       {QVTimeScope::Month, (8 + 16 + 32 + 64) / 4.0},
                                                       {QVTimeScope::Year, (2 + 4 + 8 + 16 + 32 + 64) / 6.0}};
    for (const auto& [scope, average] : expected) {
        show(*provider, scope);
        ASSERT_TRUE(waitUntilLoaded(*provider));
        EXPECT_DOUBLE_EQ(*provider->averageValue(), average) << static_cast<int>(scope);
    }
}

TEST_F(DiscreteTest, FollowsSavesAndDeletions) {
    auto provider = makeWeight();
    show(*provider, QVTimeScope::Month);
    ASSERT_TRUE(
        waitUntil([&] { return provider->hasLoadedCurrentValue() && provider->hasLoadedSecondaryValues(); }));
    EXPECT_FALSE(provider->currentValue() || provider->averageValue());
    const auto first = weight(80, "2020-03-10T07:00");
    save({first, weight(82, "2020-03-11T07:00")});
    ASSERT_TRUE(waitUntil([&] {
        return provider->currentValue() == 82 && provider->averageValue() == 81 &&
               provider->historicalData().size() == 2;
    }));
    deleteAll(VSCode::BodyMass);
    ASSERT_TRUE(waitUntil([&] {
        return !provider->currentValue() && !provider->averageValue() && provider->historicalData().empty();
    }));
    EXPECT_TRUE(provider->hasLoadedCurrentValue());
}

TEST_F(DiscreteTest, PercentagesAreShownTimesAHundred) {
    const auto* saturation =
        VSDataUnitGroupController::shared().dataUnitGroupForType(type(VSCode::OxygenSaturation));
    save({reading(VSCode::OxygenSaturation, 0.975, "%", "2020-03-14T08:00")});
    const auto provider = qv_dataProviderForDataUnit(saturation, saturation->anyDataUnit(),
                                                     saturation->chartingRules(), store, unitController);
    show(*provider, QVTimeScope::Week);
    ASSERT_TRUE(
        waitUntil([&] { return provider->hasLoadedCurrentValue() && provider->hasLoadedHistoricalData(); }));
    EXPECT_DOUBLE_EQ(*provider->currentValue(), 97.5);
    EXPECT_DOUBLE_EQ(*provider->historicalData().front()->maxYValue(), 97.5);
}

TEST_F(DiscreteTest, RangesOfBucketsAndOfTheSpan) {
    save({pulse(60, "2020-03-09T07:00"), pulse(80, "2020-03-09T08:00"), pulse(55, "2020-03-10T07:00"),
          pulse(75, "2020-03-10T08:00"), pulse(200, "2020-03-01T08:00")});
    auto provider = this->provider<QVDiscreteMinMaxDataProvider>(VSGroupID::HeartRate);
    EXPECT_EQ(provider->secondaryValueText().plainText(), "Min: No DataMax: No Data");
    show(*provider, QVTimeScope::Week);
    ASSERT_TRUE(waitUntilLoaded(*provider));
    ASSERT_EQ(provider->historicalData().size(), 2u);
    EXPECT_EQ(minOf(provider->historicalData()[0]), 60);
    EXPECT_EQ(maxOf(provider->historicalData()[0]), 80);
    EXPECT_EQ(provider->minValue(), 55);
    EXPECT_EQ(provider->maxValue(), 80);
    EXPECT_FALSE(provider->averageValue());
    const auto text = provider->secondaryValueText();
    EXPECT_EQ(text.plainText(), "Min: 55Max: 80");
    ASSERT_EQ(text.runs().size(), 3u);
    EXPECT_EQ(text.runs()[1].spacing, 6.0);
    ASSERT_TRUE(waitUntil([&] { return provider->hasLoadedCurrentValue(); }));
    EXPECT_EQ(provider->currentValue(), 75);

    save({pulse(48, "2020-03-14T07:00")});
    ASSERT_TRUE(waitUntil([&] { return provider->minValue() == 48 && provider->currentValue() == 48; }));
}

TEST_F(DiscreteTest, RangesAgreeWithTheDefinitionOnRandomReadings) {
    std::mt19937 random(314);
    std::vector<VSSamplePtr> samples;
    const VSDate now = VSEnvironment::current()->now();
    for (int i = 0; i < 3000; ++i)
        samples.push_back(std::make_shared<VSQuantitySample>(
            type(VSCode::HeartRate), VSQuantity(VSUnit::fromString("count/min"), 40 + random() % 140),
            now - std::chrono::seconds(random() % (400 * 86400)), now));
    // Readings without length.
    for (auto& sample : samples) {
        const auto& quantity = dynamic_cast<const VSQuantitySample&>(*sample).quantity();
        sample = std::make_shared<VSQuantitySample>(sample->sampleType(), quantity, sample->startDate(),
                                                    sample->startDate());
    }
    save(samples);
    auto provider = this->provider<QVDiscreteMinMaxDataProvider>(VSGroupID::HeartRate);
    for (const QVTimeScope scope : {QVTimeScope::Day, QVTimeScope::Month, QVTimeScope::Year}) {
        show(*provider, scope);
        ASSERT_TRUE(waitUntilLoaded(*provider));
        const VSDateComponents interval =
            provider->chartingRules().intervalComponentsForTimeScope(QVTimeScopeIndex(scope));
        const auto borders = VSCalendar::current().bucketBoundaries(
            *provider->startDate(), interval, *provider->startDate(), *provider->endDate());
        size_t index = 0;
        double lowest = INFINITY, highest = -INFINITY;
        for (size_t i = 0; i + 1 < borders.size(); ++i) {
            double min = INFINITY, max = -INFINITY;
            for (const auto& sample : samples) {
                if (sample->startDate() < borders[i] || sample->startDate() >= borders[i + 1]) continue;
                const double value = dynamic_cast<const VSQuantitySample&>(*sample).quantity().value();
                min = std::min(min, value);
                max = std::max(max, value);
            }
            if (min > max) continue;
            ASSERT_LT(index, provider->historicalData().size());
            const auto& point = provider->historicalData()[index++];
            EXPECT_EQ(point->xValue(), VSMidDate(borders[i], borders[i + 1]));
            EXPECT_NEAR(minOf(point), min, 1e-9);
            EXPECT_NEAR(maxOf(point), max, 1e-9);
            lowest = std::min(lowest, min);
            highest = std::max(highest, max);
        }
        EXPECT_EQ(index, provider->historicalData().size());
        EXPECT_NEAR(*provider->minValue(), lowest, 1e-9);
        EXPECT_NEAR(*provider->maxValue(), highest, 1e-9);
    }
}

TEST_F(DiscreteTest, BasalBodyTemperatureIsALineButInTheYear) {
    const auto* basal = group(VSGroupID::BasalBodyTemperature);
    unitController->updatePreferredUnit(VSUnit::fromString("degC"), basal->anyDataUnit());
    save({reading(VSCode::BasalBodyTemperature, 36.2, "degC", "2020-03-09T06:00"),
          reading(VSCode::BasalBodyTemperature, 36.6, "degC", "2020-03-09T07:00"),
          reading(VSCode::BasalBodyTemperature, 36.8, "degC", "2020-03-10T06:00")});
    auto provider = this->provider<QVBasalBodyTemperatureDataProvider>(VSGroupID::BasalBodyTemperature);
    show(*provider, QVTimeScope::Week);
    ASSERT_TRUE(waitUntilLoaded(*provider));
    ASSERT_EQ(provider->historicalData().size(), 2u);
    EXPECT_TRUE(std::holds_alternative<double>(provider->historicalData()[0]->yValue()));
    EXPECT_NEAR(*provider->historicalData()[0]->maxYValue(), 36.4, 1e-6);
    EXPECT_NEAR(*provider->minValue(), 36.4, 1e-6);
    EXPECT_NEAR(*provider->maxValue(), 36.8, 1e-6);
    show(*provider, QVTimeScope::Year);
    ASSERT_TRUE(waitUntilLoaded(*provider));
    ASSERT_EQ(provider->historicalData().size(), 1u);
    EXPECT_NEAR(minOf(provider->historicalData()[0]), 36.2, 1e-6);
    EXPECT_NEAR(*provider->minValue(), 36.2, 1e-6);
}
