#include <rapidcheck.h>

#include "ProviderTestSupport.h"
#include "Qelvar/DataProviders/QVCountDataProvider.h"
#include "Qelvar/DataProviders/QVSamplesExistDataProvider.h"
#include "Qelvar/DataProviders/QVTimePeriodDataProvider.h"

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

    // What comes while it is shown: a nap of the afternoon, which begins the next day.
    save({sleep("2020-03-14T13:00", "2020-03-14T14:00"), sleep("2020-03-13T21:00", "2020-03-13T22:00")});
    ASSERT_TRUE(waitUntil([&] {
        return provider->currentValue() == 1 && provider->historicalData().size() == 4 &&
               provider->totalForDate(date("2020-03-14")) == 8;
    }));
    show(*provider, QVTimeScope::Year);
    ASSERT_TRUE(waitUntilLoaded(*provider));
    EXPECT_DOUBLE_EQ(*provider->averageValue(), 8) << "the nap is no night of the year yet";
}

TEST_F(EventTest, StoodAndIdleHoursStayApart) {
    save({category(VSCode::ZentroStandHour, 0, "2020-03-14T09:00", "2020-03-14T10:00"),
          category(VSCode::ZentroStandHour, 1, "2020-03-14T10:00", "2020-03-14T11:00"),
          category(VSCode::ZentroStandHour, 0, "2020-03-14T11:00", "2020-03-14T12:00")});
    auto provider = this->provider<QVStackedCategoryValueDataProvider>(VSGroupID::StandHours);
    provider->setProcessAllSamples(true);
    show(*provider, QVTimeScope::Day);
    ASSERT_TRUE(waitUntil([&] { return provider->historicalData().size() >= 4; }));
    const XY points = xy(*provider);
    EXPECT_EQ(provider->dates(), (std::vector<VSDate>{date("2020-03-14")}));
    EXPECT_EQ(provider->totalForDate(date("2020-03-14")), 2) << "what was stood";
    for (const auto& [x, y] : points) EXPECT_TRUE(y == 0 || y == 1);
    EXPECT_NE(std::find(points.begin(), points.end(), std::pair(date("2020-03-14T10:00"), 0.0)),
              points.end());
    EXPECT_NE(std::find(points.begin(), points.end(), std::pair(date("2020-03-14T11:00"), 0.0)),
              points.end());
}

/// Gives its protected intake to tests.
class OpenTimePeriods : public QVTimePeriodDataProvider {
 public:
    using QVTimePeriodDataProvider::nextTicket;
    using QVTimePeriodDataProvider::QVTimePeriodDataProvider;
    using QVTimePeriodDataProvider::takeDateTotals;
};

TEST_F(EventTest, TheLastHourOfADayIsDatedWithinIt) {
    save({category(VSCode::ZentroStandHour, 0, "2020-03-13T23:00", "2020-03-14T00:00")});
    auto provider = this->provider<QVStackedCategoryValueDataProvider>(VSGroupID::StandHours);
    show(*provider, QVTimeScope::Week);
    ASSERT_TRUE(waitUntil([&] { return provider->currentValue() == 1; }));
    EXPECT_EQ(provider->lastUpdatedDate(), date("2020-03-13T23:59:59"));
}

TEST_F(EventTest, InWhateverOrderAnswersArriveTheNewestQuestionsStays) {
    EXPECT_TRUE(rc::check([this] {
        auto provider = this->provider<OpenTimePeriods>(VSGroupID::StandHours);
        provider->setStartDate(date("2020-03-14"), date("2020-03-15"), QVTimeScope::Day);
        std::vector<QVDataProvider::Ticket> arriving;
        for (int i = *rc::gen::inRange(2, 6); i > 0; --i) arriving.push_back(provider->nextTicket());
        const auto last = static_cast<double>(arriving.back());
        for (size_t i = arriving.size() - 1; i > 0; --i)
            std::swap(arriving[i], arriving[*rc::gen::inRange<size_t>(0, i + 1)]);
        for (const auto ticket : arriving) {
            const auto value = static_cast<double>(ticket);
            provider->takeDateTotals({{date("2020-03-14"), value}}, ticket);
            const auto intake = provider->intake();
            intake.updateHistoricalData({QVChartPointNumeric::chartPoint(date("2020-03-14"), value)},
                                        QVTimeScope::Day, std::nullopt, {}, ticket);
            intake.updateAverage(value, {}, {}, QVTimeScope::Day, std::nullopt, {}, ticket);
            intake.updateCurrentValue(value, date("2020-03-14"), std::nullopt, {}, ticket);
        }
        drainMainQueue();
        RC_ASSERT(provider->totalForDate(date("2020-03-14")) == last);
        RC_ASSERT(yValues(*provider) == (std::vector<std::optional<double>>{last}));
        RC_ASSERT(provider->averageValue() == last);
        RC_ASSERT(provider->currentValue() == last);
    }));
}

TEST_F(EventTest, StoodHoursAndWorkoutsInEveryScope) {
    environment->setNow(date("2020-04-02T09:00"));  // in the week after the clocks went forward
    const VSCalendar calendar = VSCalendar::current();
    constexpr VSDuration quarter = std::chrono::minutes(15);
    std::map<VSDate, double> stood, moved;  // hours by day
    std::vector<VSSamplePtr> samples;
    const auto count = [&](std::map<VSDate, double>& hours, VSDate start, VSDate end) {
        for (VSDate at = start; at < end; at = at + quarter) hours[calendar.startOfDay(at)] += 0.25;
    };
    const auto hour = [&](VSDate start, bool isIdle) {
        const VSDate end = start + 4 * quarter;
        samples.push_back(
            std::make_shared<VSCategorySample>(type(VSCode::ZentroStandHour), isIdle, start, end));
        if (!isIdle) count(stood, start, end);
    };
    const auto workout = [&](VSDate start, VSDate end) {
        samples.push_back(std::make_shared<VSWorkout>(37, start, end, VSDuration(0), std::nullopt,
                                                      std::nullopt, std::vector<VSWorkoutEvent>()));
        count(moved, start, end);
    };
    int n = 0;
    for (VSDate day = date("2019-12-20"); day < date("2020-04-02"); day = calendar.addDays(day, 1), ++n) {
        for (int i = 7; i < 22; ++i) hour(day + 4 * i * quarter, n % 9 == 0 || (5 * n + 3 * i) % 4 == 0);
        if (n % 3 == 0) workout(day + 94 * quarter, day + (95 + n % 5) * quarter);  // often over midnight
    }
    hour(date("2020-04-02"), true);  // nothing but idle today: the value is that of a day before
    workout(date("2020-04-02T07:00"), date("2020-04-02T07:30"));
    save(samples);

    const std::shared_ptr<QVTimePeriodDataProvider> providers[] = {
        provider<QVStackedCategoryValueDataProvider>(VSGroupID::StandHours),
        provider<QVTimePeriodDataProvider>(VSGroupID::Workouts)};
    for (const auto& provider : providers) {
        const auto& hours = provider == providers[0] ? stood : moved;
        std::map<QVTimeScope, double> averages;
        for (const QVTimeScope scope :
             {QVTimeScope::Day, QVTimeScope::Week, QVTimeScope::Month, QVTimeScope::Year}) {
            SCOPED_TRACE(std::string(provider->className()) + " " + std::to_string(static_cast<int>(scope)));
            show(*provider, scope);
            ASSERT_TRUE(waitUntil([&] { return !provider->isWaiting() && provider->averageValue(); }));
            EXPECT_NEAR(provider->currentValue().value_or(0), hours.rbegin()->second, 1e-9);
            std::map<VSDate, double> bars;
            double sum = 0;
            int days = 0;
            for (const auto& [day, amount] : hours) {
                if (day < *provider->startDate() || day > *provider->endDate()) continue;
                const VSDate first = scope == QVTimeScope::Year ? calendar.startOfMonth(day) : day;
                const VSDate next =
                    scope == QVTimeScope::Year ? calendar.addMonths(first, 1) : calendar.addDays(first, 1);
                bars[VSMidDate(first, next)] += amount;
                sum += amount;
                ++days;
            }
            averages[scope] = *provider->averageValue();
            if (scope == QVTimeScope::Day) continue;
            EXPECT_EQ(xy(*provider), XY(bars.begin(), bars.end()));
            EXPECT_NEAR(averages[scope], sum / days, 1e-9);
        }
        EXPECT_EQ(averages[QVTimeScope::Day], averages[QVTimeScope::Week]);
    }
}

TEST_F(EventTest, AYearOfCyclesWithKnownStarts) {
    environment->setTimeZone("America/New_York");
    struct Cycle {
        std::string firstDay;
        int days;
        int without = -1;  // a day of these that nothing was entered on
    };
    // Over both changes of the clocks and a leap day; entries at any hour of the day, and whole days.
    const std::vector<Cycle> cycles{
        {"2019-03-20", 5}, {"2019-04-02", 5}, {"2019-04-30", 4},    {"2019-05-29", 6, 1}, {"2019-06-24", 5},
        {"2019-07-23", 3}, {"2019-08-20", 5}, {"2019-09-18", 7, 4}, {"2019-10-15", 5},    {"2019-11-01", 4},
        {"2019-12-11", 5}, {"2020-01-09", 5}, {"2020-02-06", 1},    {"2020-03-06", 5, 3}};
    struct Entry {
        VSDate start, end;
        bool startsCycle, endsStretch;  // the last of days that follow each other
    };
    const VSCalendar calendar = VSCalendar::current();
    std::vector<Entry> entries;
    std::vector<VSSamplePtr> samples;
    for (size_t i = 0; i < cycles.size(); ++i) {
        for (int n = 0; n < cycles[i].days; ++n) {
            if (n == cycles[i].without) continue;
            const VSDate day = calendar.addDays(date(cycles[i].firstDay), n);
            const bool wholeDays = i % 3 == 1;
            // Points lie between 7 (the next day) and 41 hours (two days on: 34) apart.
            const VSDate start = wholeDays ? day : day + std::chrono::hours((20 + 17 * n) % 24);
            entries.push_back({start, wholeDays ? calendar.addDays(day, 1) : start, n == 0,
                               n + 1 == cycles[i].days || n + 1 == cycles[i].without});
            VSProvenance provenance;
            provenance.metadata =
                std::make_shared<const VSMetadata>(VSMetadata{{VSMetadataKeyMenstrualCycleStart, n == 0}});
            samples.push_back(std::make_shared<VSCategorySample>(type(VSCode::MenstrualFlow), 2 + n % 3,
                                                                 start, entries.back().end, provenance));
        }
    }
    auto provider = this->provider<QVMenstruationDataProvider>(VSGroupID::MenstrualFlow);
    EXPECT_EQ(provider->secondaryValueText().plainText(), "Start of Cycle: No Data");
    save(samples);
    for (const QVTimeScope scope :
         {QVTimeScope::Year, QVTimeScope::Month, QVTimeScope::Week, QVTimeScope::Day}) {
        environment->setNow(date(scope == QVTimeScope::Day ? "2020-03-08T21:00" : "2020-03-14T20:00"));
        show(*provider, scope);
        const int value = scope == QVTimeScope::Day ? 2 + 2 % 3 : 2 + 4 % 3;
        ASSERT_TRUE(waitUntil([&] { return !provider->isWaiting() && provider->currentValue() == value; }));
        EXPECT_EQ(provider->secondaryValueText().plainText(), "Start of Cycle: 3/6/20");
        EXPECT_FALSE(provider->secondaryValueText().runs().front().image.isNull());
        XY sections, starts;
        for (const Entry& entry : entries) {
            if (entry.end < *provider->startDate() || entry.start >= *provider->endDate()) continue;
            if (entry.end == *provider->startDate() && entry.start < entry.end) continue;
            if (sections.size() % 2 == 0) sections.emplace_back(entry.start, 0);
            if (entry.endsStretch) sections.emplace_back(entry.end, 0);
            if (entry.startsCycle) starts.emplace_back(entry.start, 1);
        }
        sections.insert(sections.end(), starts.begin(), starts.end());
        EXPECT_EQ(xy(*provider), sections) << "scope " << static_cast<int>(scope);
    }
    EXPECT_EQ(provider->lastUpdatedDate(), date("2020-03-08T21:00")) << "the whole day, until now";
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
    ASSERT_TRUE(waitUntil([&] { return !spotting->isWaiting(); }));
    EXPECT_FALSE(spotting->hasLoadedCurrentValue() || spotting->currentValue());
    EXPECT_EQ(spotting->secondaryValueText().plainText(), "Last Recorded: 3/11/20");
    EXPECT_TRUE(spotting->secondaryValueText().runs().front().image.isNull());

    auto mucus = provider<QVSamplesExistDataProvider>(VSGroupID::CervicalMucusQuality);
    show(*mucus, QVTimeScope::Month);
    ASSERT_TRUE(waitUntil([&] { return !mucus->isWaiting(); }));
    EXPECT_EQ(mucus->currentValue(), 3);
    EXPECT_TRUE(mucus->secondaryValueText().isEmpty());
}

TEST_F(EventTest, CountsPerDay) {
    auto provider = this->provider<QVCountDataProvider>(VSGroupID::SexualActivity);
    show(*provider, QVTimeScope::Week);
    ASSERT_TRUE(waitUntil([&] { return !provider->isWaiting(); }));
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
