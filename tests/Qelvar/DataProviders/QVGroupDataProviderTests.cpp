#include "Qelvar/DataProviders/QVGroupDataProvider.h"

#include "ProviderTestSupport.h"
#include "Qelvar/Charts/QVChartRenderer.h"
#include "Qelvar/Charts/QVLineSeries.h"
#include "Qelvar/Charts/QVStackedHorizontalLineSeries.h"
#include "Qelvar/DataProviders/QVChartSeriesFactory.h"
#include "Qelvar/DataProviders/QVCountDataProvider.h"
#include "Qelvar/DataProviders/QVDataUnitGroupDataProviders.h"

using namespace test;

namespace {

class GroupDelegate final : public QVGroupDataProviderDelegate {
 public:
    void groupDataProviderDidUpdateHistoricalData(QVGroupDataProvider& group) override {
        ++historical;
        wasComplete = group.hasLoadedHistoricalData();
    }
    void groupDataProviderDidUpdateSecondaryData(QVGroupDataProvider&) override { ++secondary; }
    void groupDataProviderDidUpdateCurrentValueData(QVGroupDataProvider&) override { ++current; }
    int historical = 0, secondary = 0, current = 0;
    bool wasComplete = false;
};

class GroupTest : public ProviderTest {
 protected:
    std::shared_ptr<QVGroupDataProvider> makeGroup(int groupID) {
        auto made = QVGroupDataProvider::create(group(groupID), unitController, store);
        made->setDelegate(delegate);
        return made;
    }
    static void showGroup(QVGroupDataProvider& provider, QVTimeScope scope) {
        const auto span = QVTimeScopeSpan(scope, VSEnvironment::current()->now(), false);
        provider.setStartDate(span->start, span->end, scope);
    }
    void savePressure(double systolic, double diastolic, const std::string& at) {
        auto upper = reading(VSCode::BloodPressureSystolic, systolic, "mmHg", at);
        auto lower = reading(VSCode::BloodPressureDiastolic, diastolic, "mmHg", at);
        save({std::make_shared<VSCorrelation>(type(VSCode::BloodPressure), date(at), date(at),
                                              std::vector<VSSamplePtr>{upper, lower})});
    }
    static bool waitUntilAllLoaded(const QVGroupDataProvider& provider) {
        return waitUntil([&] {
            return provider.hasLoadedHistoricalData() && provider.hasLoadedSecondaryValueData() &&
                   provider.hasLoadedCurrentValueData();
        });
    }
    const VSDataUnitGroup* bloodPressure = group(VSGroupID::BloodPressure);
    std::shared_ptr<GroupDelegate> delegate = std::make_shared<GroupDelegate>();
};

template <typename Series>
const Series* seriesAs(const std::shared_ptr<const QVChartSeries>& series) {
    return dynamic_cast<const Series*>(series.get());
}

}  // namespace

TEST_F(GroupTest, BloodPressureIsToldOnceBothHaveAnswered) {
    savePressure(120, 80, "2020-03-10T08:00");
    auto pressure = makeGroup(VSGroupID::BloodPressure);
    showGroup(*pressure, QVTimeScope::Week);
    EXPECT_FALSE(pressure->isActive());
    pressure->activate();
    ASSERT_TRUE(waitUntilAllLoaded(*pressure));
    drainMainQueue();
    EXPECT_EQ(delegate->historical, 1);
    EXPECT_TRUE(delegate->wasComplete);

    // Only one of the two changes: told at once, for nothing is awaited.
    save({reading(VSCode::BloodPressureSystolic, 130, "mmHg", "2020-03-11T08:00")});
    ASSERT_TRUE(waitUntil([&] { return delegate->historical == 2; }));

    // Back to a scope that was loaded before: the diastolic answer is the same as it was, and must not hold
    // back the other.
    showGroup(*pressure, QVTimeScope::Month);
    ASSERT_TRUE(waitUntilAllLoaded(*pressure));
    save({reading(VSCode::BloodPressureSystolic, 140, "mmHg", "2020-03-12T08:00")});
    const int told = delegate->historical;
    showGroup(*pressure, QVTimeScope::Week);
    ASSERT_TRUE(waitUntil([&] { return delegate->historical > told; }));
    EXPECT_TRUE(waitUntil([&] {
        return pressure->providerForDataUnit(bloodPressure->dataUnits()[0])->historicalData().size() == 3;
    }));
}

TEST_F(GroupTest, BloodPressureText) {
    auto pressure = makeGroup(VSGroupID::BloodPressure);
    showGroup(*pressure, QVTimeScope::Week);
    EXPECT_EQ(pressure->secondaryValueText().plainText(), "No Data/No DatammHg");
    pressure->activate();
    savePressure(120, 76, "2020-03-10T08:00");
    savePressure(120, 84, "2020-03-11T08:00");
    const auto text = [&] { return pressure->secondaryValueText().plainText(); };
    // Equal bounds are one number.
    ASSERT_TRUE(waitUntil([&] { return text() == QString::fromUtf8("120/76–84mmHg"); }))
        << text().toStdString();
    const auto runs = pressure->secondaryValueText().runs();
    EXPECT_EQ(std::count_if(runs.begin(), runs.end(), [](const auto& run) { return !run.image.isNull(); }),
              2);

    environment->setLocale("ar_EG");
    platform::loadTranslations();
    EXPECT_TRUE(text().contains(QString::fromUtf8("٨٤–٧٦"))) << text().toStdString();
}

TEST_F(GroupTest, LastUpdateIsTheLatestOfTheUnits) {
    auto pressure = makeGroup(VSGroupID::BloodPressure);
    save({reading(VSCode::BloodPressureSystolic, 120, "mmHg", "2020-03-10T08:00")});
    showGroup(*pressure, QVTimeScope::Week);
    pressure->activate();
    ASSERT_TRUE(waitUntilAllLoaded(*pressure));
    EXPECT_EQ(pressure->lastUpdatedDate(), date("2020-03-10T08:00"))
        << "a unit without data does not clear it";
    EXPECT_EQ(pressure->currentValueForDataUnit(bloodPressure->dataUnits()[0]), 120);
    EXPECT_FALSE(pressure->currentValueForDataUnit(bloodPressure->dataUnits()[1]));
    save({reading(VSCode::BloodPressureDiastolic, 70, "mmHg", "2020-03-12T08:00")});
    ASSERT_TRUE(waitUntil([&] { return pressure->lastUpdatedDate() == date("2020-03-12T08:00"); }));
}

TEST_F(GroupTest, NothingIsAskedBeforeActivationNorAfterDeactivation) {
    save({reading(VSCode::HeartRate, 60, "count/min", "2020-03-10T08:00")});
    auto pulse = makeGroup(VSGroupID::HeartRate);
    showGroup(*pulse, QVTimeScope::Week);
    const auto& provider = *pulse->providerForDataUnit(pulse->dataUnit());
    EXPECT_EQ(provider.historicalDataState(), QVDataState::NotLoaded);
    pulse->activate();
    pulse->activate();
    EXPECT_EQ(provider.historicalDataState(), QVDataState::Loading);
    pulse->deactivate();
    EXPECT_EQ(provider.historicalDataState(), QVDataState::NotLoaded);
    EXPECT_FALSE(pulse->isActive());
    pulse->activate();
    ASSERT_TRUE(waitUntilAllLoaded(*pulse));
    EXPECT_EQ(delegate->historical, 1);
}

TEST_F(GroupTest, FeedsAChartRenderer) {
    save({reading(VSCode::HeartRate, 60, "count/min", "2020-03-10T08:00"),
          reading(VSCode::HeartRate, 90, "count/min", "2020-03-12T08:00")});
    auto pulse = makeGroup(VSGroupID::HeartRate);
    showGroup(*pulse, QVTimeScope::Week);
    pulse->activate();
    ASSERT_TRUE(waitUntilAllLoaded(*pulse));
    auto renderer = QVChartRenderer::create(platform::mainQueue(), pulse);
    renderer->setMinXValue(pulse->startDate());
    renderer->setMaxXValue(pulse->endDate());
    bool drawn = false;
    renderer->renderChart({300, 100}, {}, 2, true,
                          [&](const QImage& chart, const QImage&, const QImage&, bool finished) {
                              drawn = !chart.isNull() && finished;
                          });
    ASSERT_TRUE(waitUntil([&] { return drawn; }));
    EXPECT_EQ(renderer->dataState(), QVChartDataState::RenderedWithData);
    EXPECT_LE(*renderer->minYValue(), 60);
    EXPECT_GE(*renderer->maxYValue(), 90);
}

TEST_F(GroupTest, SeriesFollowTheChartStyle) {
    for (const VSDataUnitGroup* each : VSDataUnitGroupController::shared().allDataUnitGroups()) {
        for (int scope = 0; scope < QVTimeScopeCount; ++scope) {
            const auto all = QVChartSeriesForDataUnitGroup(each, QVTimeScope{scope});
            ASSERT_EQ(all.size(), each->dataUnits().size());
            const auto* line = seriesAs<QVLineSeries>(all.front());
            const VSChartStyle style = each->chartingRules().chartStyleForTimeScope(scope);
            EXPECT_EQ(all.front() == nullptr, style == VSChartStyle::None);
            if (style == VSChartStyle::Line) {
                ASSERT_TRUE(line);
                EXPECT_EQ(line->pointRadius(), each->chartingRules().chartPointRadiusForTimeScope(scope));
            }
            if (style == VSChartStyle::StackedPeriods) {
                const auto* stacked = seriesAs<QVStackedHorizontalLineSeries>(all.front());
                ASSERT_TRUE(stacked);
                EXPECT_EQ(stacked->enumeratedValueOrder(), (std::vector<int>{1, 0}));
                EXPECT_EQ(stacked->valueLabels().size(), 2u);
            }
        }
    }
    EXPECT_EQ(QVPointStyleForDataUnitAtIndex(bloodPressure, 0), QVPointStyle::DownwardChevron);
    EXPECT_EQ(QVPointStyleForDataUnitAtIndex(bloodPressure, 1), QVPointStyle::UpwardChevron);
    EXPECT_EQ(QVPointStyleForDataUnitAtIndex(group(VSGroupID::HeartRate), 0), QVPointStyle::Ring);
}

TEST_F(GroupTest, EveryDisplayTypeHasItsProvider) {
    const std::pair<int, const char*> expected[] = {
        {VSGroupID::Steps, "QVCumulativeDataProvider"},
        {VSGroupID::HeartRate, "QVDiscreteMinMaxDataProvider"},
        {VSGroupID::Height, "QVDiscreteAverageDataProvider"},
        {VSGroupID::SleepAnalysis, "QVTimePeriodDataProvider"},
        {VSGroupID::Workouts, "QVTimePeriodDataProvider"},
        {VSGroupID::StandHours, "QVStackedCategoryValueDataProvider"},
        {VSGroupID::BasalBodyTemperature, "QVBasalBodyTemperatureDataProvider"},
        {VSGroupID::CervicalMucusQuality, "QVSamplesExistDataProvider"},
        {VSGroupID::OvulationTestResult, "QVOvulationDataProvider"},
        {VSGroupID::SexualActivity, "QVCountDataProvider"},
        {VSGroupID::MenstrualFlow, "QVMenstruationDataProvider"},
        {VSGroupID::Spotting, "QVSpottingDataProvider"}};
    const auto nameOf = [&](const VSDataUnitGroup* each, const VSDataUnit* unit) {
        return std::string(
            qv_dataProviderForDataUnit(each, unit, each->chartingRules(), store, unitController)
                ->className());
    };
    for (const auto& [id, name] : expected)
        EXPECT_EQ(nameOf(group(id), group(id)->anyDataUnit()), name) << id;
    // Every display type of the catalogue can be put on a card and ends up with everything loaded.
    for (const VSDataUnitGroup* each : VSDataUnitGroupController::shared().allDataUnitGroups()) {
        auto provider = QVGroupDataProvider::create(each, unitController, store);
        showGroup(*provider, QVTimeScope::Week);
        provider->activate();
        EXPECT_TRUE(waitUntil([&] { return !provider->isWaiting(); })) << each->displayName().toStdString();
    }
}
