#include "Qelvar/Dashboard/QVDashboardChartItem.h"

#include <gtest/gtest.h>

#include "Platform/Localization.h"
#include "Platform/SystemEvents.h"
#include "Qelvar/Charts/QVStackedValueSeries.h"
#include "QtTestSupport.h"
#include "TestSupport.h"
#include "VessaUI/VSDataCategory.h"

using namespace test;

namespace {

class ItemDelegate final : public QVDashboardChartItemDelegate {
 public:
    void chartItemDidUpdateHistoricalData(QVDashboardChartItem&) override { ++historical; }
    void chartItemDidUpdateCurrentValueData(QVDashboardChartItem&) override { ++current; }
    void chartItemDidUpdateSecondaryValueData(QVDashboardChartItem&) override { ++secondary; }
    int historical = 0, current = 0, secondary = 0;
};

class ChartItemTest : public ::testing::Test {
 protected:
    ChartItemTest() {
        platform::loadTranslations();
        store = VSHealthStore::open(folder.path()).value();
        unitController = std::make_shared<VSUnitController>(store);
    }
    std::shared_ptr<QVDashboardChartItem> makeItem(int groupID) {
        const auto* group = VSDataUnitGroupController::shared().dataUnitGroupWithID(groupID);
        auto item = QVDashboardChartItem::create(
            group, VSDataCategoryController::shared().categoryWithID(group->categoryID()), unitController,
            store);
        item->setDelegate(delegate);
        return item;
    }
    void save(VSTypeCode code, double value, const char* unit, const std::string& at) {
        const auto status = store->saveObjectsAndWait({std::make_shared<VSQuantitySample>(
            VSObjectType::dataTypeWithCode(code), VSQuantity(VSUnit::fromString(unit), value), date(at),
            date(at))});
        ASSERT_TRUE(status) << status.error().message;
    }
    static QString valueText(const QVDashboardChartItem& item) {
        return item.mostRecentValue(platform::systemFont(20), platform::systemFont(12)).plainText();
    }

    FixedEnvironment environment{"2020-03-14T20:00"};
    TemporaryFolder folder;
    std::shared_ptr<VSHealthStore> store;
    std::shared_ptr<VSUnitController> unitController;
    std::shared_ptr<ItemDelegate> delegate = std::make_shared<ItemDelegate>();
    QVDateCache dateCache;
};

}  // namespace

TEST_F(ChartItemTest, SpansAndInsetsOfTheScopes) {
    auto item = makeItem(VSGroupID::Steps);
    const auto spans = [&](QVTimeScope scope) {
        item->updateDateRange(dateCache, scope);
        EXPECT_EQ(item->chartRenderer()->minXValue(), item->startDate());
        EXPECT_EQ(item->chartRenderer()->maxXValue(), item->endDate());
        EXPECT_EQ(item->dataProvider()->timeScope(), scope);
        return std::pair(*item->startDate(), *item->endDate());
    };
    EXPECT_EQ(spans(QVTimeScope::Day), std::pair(date("2020-03-14"), date("2020-03-15")));
    EXPECT_EQ(item->chartRenderer()->chartInsets(), (QVEdgeInsets{0, 26, 0, 38}));
    EXPECT_EQ(spans(QVTimeScope::Week), std::pair(date("2020-03-08"), date("2020-03-15")));
    EXPECT_EQ(item->chartRenderer()->chartInsets(), (QVEdgeInsets{0, 13, 0, 39}));
    EXPECT_EQ(spans(QVTimeScope::Month), std::pair(date("2020-02-13"), date("2020-03-15")));
    EXPECT_EQ(item->chartRenderer()->chartInsets(), (QVEdgeInsets{0, 24, 0, 36}));
    EXPECT_EQ(spans(QVTimeScope::Year), std::pair(date("2019-04-01"), date("2020-03-31T23:59:59")));
    EXPECT_EQ(item->chartRenderer()->chartInsets(), (QVEdgeInsets{0, 14, 0, 41}));
    item->updateDateRange(dateCache, QVTimeScope::Hour);
    EXPECT_FALSE(item->startDate() || item->endDate());
    EXPECT_EQ(item->chartRenderer()->chartInsets(), QVEdgeInsets{});

    // Nights are shown from noon to noon, in the day alone.
    item = makeItem(VSGroupID::SleepAnalysis);
    EXPECT_EQ(spans(QVTimeScope::Day), std::pair(date("2020-03-13T12:00"), date("2020-03-14T12:00")));
    EXPECT_EQ(spans(QVTimeScope::Week), std::pair(date("2020-03-08"), date("2020-03-15")));
}

TEST_F(ChartItemTest, TheSameSpanIsNotLoadedAgainAndANewDayIs) {
    save(VSCode::StepCount, 100, "count", "2020-03-14T08:00");
    auto item = makeItem(VSGroupID::Steps);
    item->updateDateRange(dateCache, QVTimeScope::Week);
    item->activate();
    item->activate();
    ASSERT_TRUE(waitUntil([&] { return item->dataProvider()->hasLoadedHistoricalData(); }));
    EXPECT_EQ(delegate->historical, 1);
    bool drawn = false;
    item->chartRenderer()->renderChart({200, 80}, {}, 1, true, [&](auto&&...) { drawn = true; });
    ASSERT_TRUE(waitUntil([&] { return drawn; }));
    item->updateDateRange(dateCache, QVTimeScope::Week);
    EXPECT_FALSE(item->chartRenderer()->chartFillImage().isNull()) << "nothing changed, nothing is dropped";

    environment->setNow(date("2020-03-15T00:00:01"));
    platform::SystemEvents::shared().postSignificantTimeChange();
    item->updateDateRange(dateCache, QVTimeScope::Week);
    EXPECT_EQ(item->startDate(), date("2020-03-09"));
    EXPECT_TRUE(item->chartRenderer()->chartFillImage().isNull());
    const int told = delegate->historical;
    ASSERT_TRUE(waitUntil([&] { return delegate->historical > told; }));
    EXPECT_EQ(item->dataProvider()
                  ->providerForDataUnit(item->dataUnitGroup()->anyDataUnit())
                  ->historicalData()[0]
                  ->xValue(),
              date("2020-03-09T12:00"));
}

TEST_F(ChartItemTest, CurrentValueTexts) {
    auto pulse = makeItem(VSGroupID::HeartRate);
    EXPECT_EQ(valueText(*pulse), QString()) << "nothing is claimed before it was asked for";
    EXPECT_TRUE(pulse->mostRecentValueUnitString().isEmpty() && pulse->mostRecentValueUnitIcon().isEmpty());
    pulse->updateDateRange(dateCache, QVTimeScope::Week);
    pulse->activate();
    ASSERT_TRUE(waitUntil([&] { return pulse->dataProvider()->hasLoadedCurrentValueData(); }));
    EXPECT_EQ(valueText(*pulse), "No Data");
    EXPECT_FALSE(pulse->lastUpdated());

    save(VSCode::HeartRate, 64, "count/min", "2020-03-14T08:00");
    ASSERT_TRUE(waitUntil([&] { return pulse->lastUpdated().has_value(); }));
    EXPECT_EQ(pulse->lastUpdated(), date("2020-03-14T08:00"));
    EXPECT_TRUE(valueText(*pulse).startsWith("64")) << valueText(*pulse).toStdString();
    EXPECT_TRUE(valueText(*pulse).contains(pulse->mostRecentValueUnitString()));
    EXPECT_FALSE(pulse->mostRecentValueUnitString().isEmpty());
    EXPECT_EQ(pulse->mostRecentValueUnitIcon(), pulse->dataUnitGroup()->unitIcon());
    ASSERT_TRUE(waitUntil([&] { return pulse->secondaryValue().plainText() == "Min: 64Max: 64"; }));
    EXPECT_GT(delegate->current, 0);
    EXPECT_GT(delegate->secondary, 0);

    auto pressure = makeItem(VSGroupID::BloodPressure);
    save(VSCode::BloodPressureSystolic, 120, "mmHg", "2020-03-14T09:00");
    pressure->updateDateRange(dateCache, QVTimeScope::Week);
    pressure->activate();
    ASSERT_TRUE(waitUntil([&] { return pressure->dataProvider()->hasLoadedCurrentValueData(); }));
    EXPECT_EQ(valueText(*pressure), "120/No Data");
    EXPECT_TRUE(pressure->mostRecentValueUnitString().isEmpty());
}

TEST_F(ChartItemTest, InvalidationLoadsTheCurrentValueAgain) {
    save(VSCode::BodyMass, 70, "kg", "2020-03-14T08:00");
    const auto* group = VSDataUnitGroupController::shared().dataUnitGroupForType(
        VSObjectType::dataTypeWithCode(VSCode::BodyMass));
    auto item = makeItem(group->dataUnitGroupID());
    item->updateDateRange(dateCache, QVTimeScope::Week);
    item->activate();
    ASSERT_TRUE(waitUntil([&] { return item->dataProvider()->hasLoadedCurrentValueData(); }));
    const QString before = valueText(*item);
    const int told = delegate->current;
    item->invalidateChart();
    EXPECT_EQ(valueText(*item), QString());
    ASSERT_TRUE(waitUntil([&] { return delegate->current > told; }))
        << "the same value must come back to the card";
    EXPECT_EQ(valueText(*item), before);
    item->deactivate();
    EXPECT_FALSE(item->isActive());
    EXPECT_TRUE(item->dataProvider()->isActive()) << "the provider keeps running";
}

TEST_F(ChartItemTest, LabelsInTheChartFollowTheLanguage) {
    auto item = makeItem(VSGroupID::StandHours);
    item->updateDateRange(dateCache, QVTimeScope::Day);
    const auto labels = [&] {
        const auto* stacked =
            dynamic_cast<const QVStackedValueSeries*>(item->dataProvider()->chartSeriesForIndex(0).get());
        return stacked ? stacked->valueLabels() : std::map<int, QString>();
    };
    const auto english = labels();
    ASSERT_FALSE(english.empty());
    environment->setLocale("de_DE");
    platform::loadTranslations();
    item->setLocaleDidChange(true);
    EXPECT_NE(labels(), english);
    environment->setLocale("en_US");
    platform::loadTranslations();
}

TEST_F(ChartItemTest, EqualityAndBackgroundFlags) {
    auto steps = makeItem(VSGroupID::Steps);
    EXPECT_TRUE(*steps == *makeItem(VSGroupID::Steps));
    EXPECT_FALSE(*steps == *makeItem(VSGroupID::HeartRate));
    EXPECT_EQ(std::hash<QVDashboardChartItem>()(*steps),
              std::hash<QVDashboardChartItem>()(*makeItem(VSGroupID::Steps)));
    EXPECT_FALSE(steps->shouldHideMinMaxOnBackgroundForTimeScope(QVTimeScope::Day));
    EXPECT_TRUE(
        makeItem(VSGroupID::MenstrualFlow)->shouldHideMinMaxOnBackgroundForTimeScope(QVTimeScope::Month));
    const auto sleep = makeItem(VSGroupID::SleepAnalysis);
    EXPECT_EQ(sleep->shouldHideAverageLineForTimeScope(QVTimeScope::Week),
              sleep->dataUnitGroup()->chartingRules().shouldHideAverageLine());
}
