#include "ProviderTestSupport.h"
#include "Qelvar/DataProviders/QVCountDataProvider.h"
#include "Qelvar/DataProviders/QVSamplesExistDataProvider.h"
#include "Qelvar/DataProviders/QVTimePeriodDataProvider.h"
#include "VessaUI/VSTimePeriods.h"

using namespace test;

namespace {

class EventTest : public ProviderTest {
 protected:
    VSSamplePtr sleep(const std::string& start, const std::string& end, int value = 1) {
        return category(VSCode::SleepAnalysis, value, start, end);
    }
    static std::vector<std::pair<VSDate, double>> xy(const QVDataProvider& provider) {
        std::vector<std::pair<VSDate, double>> result;
        for (const auto& point : provider.historicalData())
            result.emplace_back(point->xValue(), point->yValueFloatRepresentation());
        return result;
    }
};

using XY = std::vector<std::pair<VSDate, double>>;

}  // namespace

TEST_F(EventTest, JoinedSpansAndTheirHoursPerBucket) {
    const auto spans = VSCoalesceTimePeriodsFromSamples(
        {sleep("2020-03-10T02:00", "2020-03-10T07:00"), sleep("2020-03-09T23:00", "2020-03-10T03:00"),
         sleep("2020-03-10T07:00", "2020-03-10T07:30"), sleep("2020-03-11T13:00", "2020-03-11T13:00")});
    EXPECT_EQ(spans, (std::vector<VSTimeSpan>{{date("2020-03-09T23:00"), date("2020-03-10T07:30")},
                                              {date("2020-03-11T13:00"), date("2020-03-11T13:00")}}));
    const VSCalendar calendar = VSCalendar::current();
    // Midnight cuts the night.
    const auto days = VSCalculateTotalDurations(spans, date("2020-03-09"), date("2020-03-14"), {.days = 1},
                                                false, calendar);
    ASSERT_EQ(days.size(), 3u);
    EXPECT_DOUBLE_EQ(days[0].hours, 1);
    EXPECT_DOUBLE_EQ(days[1].hours, 7.5);
    EXPECT_DOUBLE_EQ(days[2].hours, 0);
    // From noon to noon it is whole, and a month of nights is a calendar month.
    const auto nights = VSCalculateTotalDurations(spans, date("2020-03-08T12:00"), date("2020-03-13T12:00"),
                                                  {.days = 1}, true, calendar);
    ASSERT_EQ(nights.size(), 2u);
    EXPECT_DOUBLE_EQ(nights[0].hours, 8.5);
    EXPECT_EQ(nights[0].bucket, (VSTimeSpan{date("2020-03-09T12:00"), date("2020-03-10T12:00")}));
    const auto months = VSCalculateTotalDurations({{date("2020-01-31T11:00"), date("2020-01-31T14:00")},
                                                   {date("2020-02-29T10:00"), date("2020-02-29T13:00")}},
                                                  date("2019-11-30T12:00"), date("2020-03-31T12:00"),
                                                  {.months = 1}, true, calendar);
    ASSERT_EQ(months.size(), 3u);
    EXPECT_DOUBLE_EQ(months[0].hours, 1) << "until noon of 31 January";
    EXPECT_DOUBLE_EQ(months[1].hours, 4);
    EXPECT_DOUBLE_EQ(months[2].hours, 1);
    EXPECT_EQ(months[1].bucket, (VSTimeSpan{date("2020-01-31T12:00"), date("2020-02-29T12:00")}));
}

TEST_F(EventTest, SleepInDaysFromNoonToNoon) {
    save({sleep("2020-03-12T23:00", "2020-03-13T03:00"), sleep("2020-03-13T02:00", "2020-03-13T07:00"),
          sleep("2020-03-13T23:30", "2020-03-14T06:30"),
          sleep("2020-03-13T22:00", "2020-03-14T08:00", 0 /* in bed */)});
    auto provider = this->provider<QVTimePeriodDataProvider>(VSGroupID::SleepAnalysis);
    provider->setProcessAllSamples(true);
    show(*provider, QVTimeScope::Day, true);
    ASSERT_TRUE(waitUntilLoaded(*provider));
    EXPECT_EQ(xy(*provider), (XY{{date("2020-03-13T23:30"), 0}, {date("2020-03-14T06:30"), 0}}));
    EXPECT_DOUBLE_EQ(*provider->averageValue(), 7.5);
    EXPECT_EQ(provider->dates(), (std::vector<VSDate>{date("2020-03-14")}));
    EXPECT_DOUBLE_EQ(*provider->totalForDate(date("2020-03-14")), 7);
    ASSERT_TRUE(waitUntil([&] { return provider->hasLoadedCurrentValue(); }));
    EXPECT_DOUBLE_EQ(*provider->currentValue(), 7);
    EXPECT_EQ(provider->lastUpdatedDate(), date("2020-03-14T06:30"));
    EXPECT_TRUE(provider->secondaryValueText().plainText().contains("7"))
        << provider->secondaryValueText().plainText().toStdString();

    show(*provider, QVTimeScope::Week);
    ASSERT_TRUE(waitUntilLoaded(*provider));
    EXPECT_EQ(xy(*provider), (XY{{date("2020-03-13T12:00"), 8}, {date("2020-03-14T12:00"), 7}}));
    show(*provider, QVTimeScope::Year);
    ASSERT_TRUE(waitUntilLoaded(*provider));
    ASSERT_EQ(provider->historicalData().size(), 1u);
    EXPECT_NEAR(provider->historicalData()[0]->yValueFloatRepresentation(), 15, 1e-9);
    EXPECT_NEAR(*provider->averageValue(), 7.5, 1e-9) << "a night, not a month";

    // A nap that starts after noon belongs to the coming night.
    save({sleep("2020-03-14T13:00", "2020-03-14T14:00")});
    ASSERT_TRUE(waitUntil([&] { return provider->currentValue() == 1; }));
}

TEST_F(EventTest, TheLastNightOfTheMonthIsInTheYear) {
    environment->setNow(date("2020-03-31T20:00"));
    save({sleep("2020-03-30T23:00", "2020-03-31T07:00"), sleep("2019-03-31T23:00", "2019-04-01T06:00")});
    auto provider = this->provider<QVTimePeriodDataProvider>(VSGroupID::SleepAnalysis);
    show(*provider, QVTimeScope::Year);
    ASSERT_TRUE(waitUntilLoaded(*provider));
    ASSERT_EQ(provider->historicalData().size(), 2u);
    EXPECT_NEAR(provider->historicalData().front()->yValueFloatRepresentation(), 7, 1e-9);
    EXPECT_NEAR(provider->historicalData().back()->yValueFloatRepresentation(), 8, 1e-9);
}

TEST_F(EventTest, StoodAndIdleHoursStayApart) {
    save({category(VSCode::ZentroStandHour, 0, "2020-03-14T09:00", "2020-03-14T10:00"),
          category(VSCode::ZentroStandHour, 1, "2020-03-14T10:00", "2020-03-14T11:00"),
          category(VSCode::ZentroStandHour, 0, "2020-03-14T11:00", "2020-03-14T12:00")});
    auto provider = this->provider<QVStackedCategoryValueDataProvider>(VSGroupID::StandHours);
    show(*provider, QVTimeScope::Day);
    ASSERT_TRUE(waitUntil([&] { return provider->historicalData().size() >= 4; }));
    const XY points = xy(*provider);
    for (const auto& [x, y] : points) EXPECT_TRUE(y == 0 || y == 1);
    EXPECT_NE(std::find(points.begin(), points.end(), std::pair(date("2020-03-14T10:00"), 0.0)),
              points.end());
    EXPECT_NE(std::find(points.begin(), points.end(), std::pair(date("2020-03-14T11:00"), 0.0)),
              points.end());
}

TEST_F(EventTest, CyclesAreSectionsWithTheirStarts) {
    const auto flow = [&](const std::string& start, const std::string& end, bool cycleStart) {
        return category(VSCode::MenstrualFlow, 2, start, end,
                        {{VSMetadataKeyMenstrualCycleStart, cycleStart}});
    };
    save({flow("2020-03-01", "2020-03-02", true), flow("2020-03-02", "2020-03-03", false),
          flow("2020-03-03", "2020-03-04", false), flow("2020-03-10T08:00", "2020-03-10T08:00", false),
          flow("2020-03-11T20:00", "2020-03-11T20:00", false)});
    auto provider = this->provider<QVMenstruationDataProvider>(VSGroupID::MenstrualFlow);
    EXPECT_EQ(provider->secondaryValueText().plainText(), "Start of Cycle: No Data");
    show(*provider, QVTimeScope::Month);
    ASSERT_TRUE(waitUntil([&] {
        return provider->hasLoadedHistoricalData() && provider->hasLoadedSecondaryValues() &&
               provider->hasLoadedCurrentValue();
    }));
    EXPECT_EQ(xy(*provider), (XY{{date("2020-03-01"), 0},
                                 {date("2020-03-04"), 0},
                                 {date("2020-03-10T08:00"), 0},
                                 {date("2020-03-11T20:00"), 0},
                                 {date("2020-03-01"), 1}}));
    EXPECT_EQ(provider->currentValue(), 2);
    EXPECT_EQ(provider->lastUpdatedDate(), date("2020-03-11T20:00"));
    EXPECT_EQ(provider->secondaryValueText().plainText(), "Start of Cycle: 3/2/20");
    EXPECT_FALSE(provider->secondaryValueText().runs().front().image.isNull());
    show(*provider, QVTimeScope::Week);
    EXPECT_EQ(provider->secondaryValueText().plainText(), "Start of Cycle: 3/2/20")
        << "the same in every scope";
}

TEST_F(EventTest, WhatEachPresenceTypeShows) {
    save({category(VSCode::OvulationTestResult, 1, "2020-03-10", "2020-03-10"),
          category(VSCode::IntermenstrualBleeding, 0, "2020-03-11T10:00", "2020-03-11T10:00"),
          category(VSCode::CervicalMucusQuality, 3, "2020-03-12T10:00", "2020-03-12T10:00")});
    auto ovulation = provider<QVOvulationDataProvider>(VSGroupID::OvulationTestResult);
    show(*ovulation, QVTimeScope::Month);
    ASSERT_TRUE(waitUntil(
        [&] { return ovulation->hasLoadedSecondaryValues() && ovulation->hasLoadedCurrentValue(); }));
    EXPECT_EQ(ovulation->secondaryValueText().plainText(), "Last Positive: No Data");
    save({category(VSCode::OvulationTestResult, 2, "2020-03-13", "2020-03-13")});
    ASSERT_TRUE(
        waitUntil([&] { return ovulation->secondaryValueText().plainText() == "Last Positive: 3/13/20"; }));
    ASSERT_TRUE(waitUntil([&] { return ovulation->historicalData().size() > 2; }));
    EXPECT_EQ(xy(*ovulation).back(), std::pair(date("2020-03-13"), 1.0));

    auto spotting = provider<QVSpottingDataProvider>(VSGroupID::Spotting);
    show(*spotting, QVTimeScope::Month);
    ASSERT_TRUE(waitUntilLoaded(*spotting));
    EXPECT_FALSE(spotting->hasLoadedCurrentValue() || spotting->currentValue());
    EXPECT_EQ(spotting->secondaryValueText().plainText(), "Last Recorded: 3/11/20");
    EXPECT_TRUE(spotting->secondaryValueText().runs().front().image.isNull());

    auto mucus = provider<QVSamplesExistDataProvider>(VSGroupID::CervicalMucusQuality);
    show(*mucus, QVTimeScope::Month);
    ASSERT_TRUE(waitUntil([&] { return mucus->currentValue() == 3; }));
    EXPECT_TRUE(mucus->secondaryValueText().isEmpty());
}

TEST_F(EventTest, CountsPerDay) {
    auto provider = this->provider<QVCountDataProvider>(VSGroupID::SexualActivity);
    show(*provider, QVTimeScope::Week);
    ASSERT_TRUE(waitUntilLoaded(*provider));
    EXPECT_EQ(provider->secondaryValueText().plainText(), "Last Activity: No Data");
    const auto at = [&](const std::string& when) { return category(VSCode::SexualActivity, 0, when, when); };
    save({at("2020-03-10T01:00"), at("2020-03-10T12:00"), at("2020-03-10T23:59"), at("2020-03-12T00:00"),
          at("2020-03-01T00:00")});
    ASSERT_TRUE(
        waitUntil([&] { return provider->historicalData().size() == 2 && provider->averageValue(); }));
    EXPECT_EQ(xy(*provider), (XY{{date("2020-03-10T12:00"), 3}, {date("2020-03-12T12:00"), 1}}));
    EXPECT_EQ(provider->secondaryValueText().plainText(), "Last Activity: 3/12/20");
    EXPECT_EQ(provider->currentValueDataState(), QVDataState::NotLoaded);
}
