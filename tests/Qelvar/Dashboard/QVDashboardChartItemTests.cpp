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
    EXPECT_TRUE(item->chartRenderer()->chartFillImage().isNull()) << "of another span";
}

TEST_F(ChartItemTest, ANewDayIsAskedAboutThoughTheYearStays) {
    // Of tomorrow, seen from before midnight: written ahead, as an import may bring it.
    save(VSCode::StepCount, 70, "count", "2020-03-14T08:00");
    save(VSCode::StepCount, 80, "count", "2020-03-15T08:00");
    auto item = makeItem(VSGroupID::Steps);
    environment->setNow(date("2020-03-14T23:59"));
    item->updateDateRange(dateCache, QVTimeScope::Year);
    item->activate();
    ASSERT_TRUE(waitUntil([&] { return item->lastUpdated() == date("2020-03-14T08:00"); }));
    environment->setNow(date("2020-03-15T00:00:01"));
    platform::SystemEvents::shared().postSignificantTimeChange();
    item->updateDateRange(dateCache, QVTimeScope::Year);
    EXPECT_TRUE(waitUntil([&] { return item->lastUpdated() == date("2020-03-15T08:00"); }));
}

TEST_F(ChartItemTest, EveryScopeMovesOnWithTheDay) {
    const auto sleep = [](const std::string& start, const std::string& end) {
        return std::make_shared<VSCategorySample>(VSObjectType::dataTypeWithCode(VSCode::SleepAnalysis), 1,
                                                  date(start), date(end));
    };
    for (int day = 27; day <= 31; ++day)
        save(VSCode::StepCount, day, "count", "2020-03-" + std::to_string(day) + "T08:00");
    ASSERT_TRUE(store->saveObjectsAndWait(
        {sleep("2020-03-30T23:00", "2020-03-31T06:00"), sleep("2020-03-31T22:00", "2020-03-31T23:30")}));
    using Values = std::vector<std::optional<double>>;
    struct Case {
        int group;
        QVTimeScope scope;
        size_t points;     // before and after
        VSDate first;      // x of the first one afterwards
        Values last;       // the values of the last two
        Values lastAfter;  // afterwards
    };
    const Values none;
    const std::vector<Case> cases{
        {VSGroupID::Steps, QVTimeScope::Day, 24, {}, {std::nullopt, std::nullopt}, none},
        {VSGroupID::Steps, QVTimeScope::Week, 7, date("2020-03-26T12:00"), {30, 31}, {31, std::nullopt}},
        {VSGroupID::Steps, QVTimeScope::Month, 31, date("2020-03-02T12:00"), {30, 31}, {31, std::nullopt}},
        {VSGroupID::Steps,
         QVTimeScope::Year,
         12,
         date("2019-05-16T12:00"),
         {std::nullopt, 145},
         {145, std::nullopt}},
        {VSGroupID::SleepAnalysis, QVTimeScope::Day, 2, date("2020-03-31T22:00"), {0, 0}, {0, 0}},
        {VSGroupID::SleepAnalysis, QVTimeScope::Week, 1, date("2020-03-31T12:00"), {7}, {7, 1.5}},
        {VSGroupID::SleepAnalysis, QVTimeScope::Year, 1, date("2020-03-15T23:30"), {7}, {7, 1.5}},
    };
    for (const Case& each : cases) {
        SCOPED_TRACE(std::to_string(each.group) + ", " + std::to_string(static_cast<int>(each.scope)));
        environment->setNow(date("2020-03-31T23:59"));
        platform::SystemEvents::shared().postSignificantTimeChange();
        auto item = makeItem(each.group);
        const auto& provider =
            item->dataProvider()->providerForDataUnit(item->dataUnitGroup()->anyDataUnit());
        const auto lastTwo = [&] {
            Values values;
            for (const auto& point : provider->historicalData()) values.push_back(point->maxYValue());
            if (values.size() > 2) values.erase(values.begin(), values.end() - 2);
            return values;
        };
        item->updateDateRange(dateCache, each.scope);
        item->activate();
        ASSERT_TRUE(waitUntil([&] { return provider->historicalData().size() == each.points; }));
        EXPECT_EQ(lastTwo(), each.last);
        environment->setNow(date("2020-04-01T00:00:01"));
        platform::SystemEvents::shared().postSignificantTimeChange();
        item->updateDateRange(dateCache, each.scope);
        ASSERT_TRUE(waitUntil([&] {
            return lastTwo() == each.lastAfter &&
                   (each.lastAfter.empty() || provider->historicalData().front()->xValue() == each.first);
        }));
    }
}

TEST_F(ChartItemTest, ANewUnitIsShownAtOnceAndNothingGoesBlank) {
    save(VSCode::BodyMass, 70, "kg", "2020-03-14T08:00");
    const auto* group = VSDataUnitGroupController::shared().dataUnitGroupForType(
        VSObjectType::dataTypeWithCode(VSCode::BodyMass));
    unitController->updatePreferredUnit(VSUnit::fromString("kg"), group->anyDataUnit());
    auto item = makeItem(group->dataUnitGroupID());
    item->updateDateRange(dateCache, QVTimeScope::Week);
    item->activate();
    ASSERT_TRUE(waitUntil([&] { return !item->dataProvider()->isWaiting(); }));
    // The second time before the store has answered.
    for (const auto& [unit, value, average] : {std::tuple("lb", "154.3", "154.3"), {"st", "11", "11"}}) {
        const int before[] = {delegate->historical, delegate->current, delegate->secondary};
        unitController->updatePreferredUnit(VSUnit::fromString(unit), group->anyDataUnit());
        const int after[] = {delegate->historical, delegate->current, delegate->secondary};
        for (int i = 0; i < 3; ++i) EXPECT_GT(after[i], before[i]);
        EXPECT_TRUE(valueText(*item).startsWith(value)) << valueText(*item).toStdString();
        EXPECT_TRUE(item->secondaryValue().plainText().startsWith(QString("Daily Average: ") + average));
    }
    ASSERT_TRUE(waitUntil([&] { return item->dataProvider()->hasLoadedCurrentValueData(); }));
    EXPECT_TRUE(valueText(*item).startsWith("11"));
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
