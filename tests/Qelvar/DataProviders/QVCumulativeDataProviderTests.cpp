#include "Qelvar/DataProviders/QVCumulativeDataProvider.h"

#include <random>

#include "DaysOfICU.h"
#include "ProviderTestSupport.h"

using namespace test;

namespace {

class CumulativeTest : public ProviderTest {
 protected:
    VSSamplePtr steps(double count, const std::string& start, const std::string& end) {
        return quantity(VSCode::StepCount, count, "count", start, end);
    }
    std::shared_ptr<QVCumulativeDataProvider> makeSteps() {
        auto made = provider<QVCumulativeDataProvider>(VSGroupID::Steps);
        made->setDelegate(delegate);
        return made;
    }
    std::shared_ptr<RecordingDelegate> delegate = std::make_shared<RecordingDelegate>();
};

/// What the samples of one source come to in [from, to): each span's value in proportion to the time that it
/// shares.
double oracleTotal(const std::vector<VSSamplePtr>& samples, VSDate from, VSDate to, bool* any = nullptr) {
    double total = 0;
    for (const auto& sample : samples) {
        const double value = dynamic_cast<const VSQuantitySample&>(*sample).quantity().value();
        const VSDate start = sample->startDate(), end = sample->endDate();
        double share = 0;
        if (start == end)
            share = start >= from && start < to ? 1 : 0;
        else
            share = std::max(0.0, VSSecondsFromDuration(std::min(end, to) - std::max(start, from))) /
                    VSSecondsFromDuration(end - start);
        if (share > 0 && any) *any = true;
        total += share * value;
    }
    return total;
}

}  // namespace

TEST_F(CumulativeTest, AWeekWithThreeDaysOfData) {
    save({steps(1000, "2020-03-09T10:00", "2020-03-09T11:00"),
          steps(500, "2020-03-09T18:00", "2020-03-09T18:30"),
          steps(600, "2020-03-11T08:00", "2020-03-11T08:20"),
          steps(2400, "2020-03-14T09:00", "2020-03-14T10:00")});
    auto provider = makeSteps();
    show(*provider, QVTimeScope::Week);
    EXPECT_EQ(provider->historicalDataState(), QVDataState::Loading);
    ASSERT_TRUE(waitUntilLoaded(*provider));
    const std::optional<double> none;
    EXPECT_EQ(yValues(*provider),
              (std::vector<std::optional<double>>{none, 1500, none, 600, none, none, 2400}));
    EXPECT_EQ(provider->historicalData()[1]->xValue(), date("2020-03-09T12:00"));
    EXPECT_DOUBLE_EQ(*provider->averageValue(), 1500.0);
    EXPECT_FALSE(provider->minValue() || provider->maxValue());
    EXPECT_EQ(provider->secondaryValueText().plainText(), "Daily Average: 1,500");
    ASSERT_TRUE(waitUntil([&] { return provider->hasLoadedCurrentValue(); }));
    EXPECT_EQ(provider->currentValue(), 2400);
    EXPECT_EQ(provider->lastUpdatedDate(), date("2020-03-14T10:00"));
}

TEST_F(CumulativeTest, NoDataIsAnEmptyListAndLoaded) {
    save({steps(100, "2020-01-01T10:00", "2020-01-01T11:00")});
    auto provider = makeSteps();
    show(*provider, QVTimeScope::Week);
    ASSERT_TRUE(waitUntilLoaded(*provider));
    EXPECT_TRUE(provider->historicalData().empty());
    EXPECT_FALSE(provider->averageValue());
    EXPECT_EQ(provider->secondaryValueText().plainText(), "Daily Average: No Data");

    auto flights = this->provider<QVCumulativeDataProvider>(VSGroupID::FlightsClimbed);
    show(*flights, QVTimeScope::Week);
    ASSERT_TRUE(waitUntil([&] { return flights->hasLoadedCurrentValue(); }));
    EXPECT_FALSE(flights->currentValue() || flights->lastUpdatedDate());
}

TEST_F(CumulativeTest, YesterdayUntilSomethingHappensToday) {
    save({steps(400, "2020-03-13T08:00", "2020-03-13T08:30"),
          steps(100, "2020-03-13T23:30", "2020-03-13T23:40")});
    auto provider = makeSteps();
    show(*provider, QVTimeScope::Week);
    ASSERT_TRUE(waitUntil([&] { return provider->hasLoadedCurrentValue(); }));
    EXPECT_EQ(provider->currentValue(), 500);
    EXPECT_EQ(provider->lastUpdatedDate(), date("2020-03-13T23:40"));
    save({steps(30, "2020-03-14T07:00", "2020-03-14T07:10")});
    ASSERT_TRUE(waitUntil([&] { return provider->currentValue() == 30; }));
    // What starts tomorrow is not the latest news.
    save({steps(77, "2020-03-15T00:00", "2020-03-15T00:10"),
          steps(12, "2020-03-14T19:00", "2020-03-14T19:10")});
    ASSERT_TRUE(waitUntil([&] { return provider->currentValue() == 42; }));
    EXPECT_EQ(provider->lastUpdatedDate(), date("2020-03-14T19:10"));
}

TEST_F(CumulativeTest, TheDayOfTheCurrentValueIsThatOfTheUsersZone) {
    save({steps(100, "2020-03-14T02:00", "2020-03-14T02:10"),
          steps(200, "2020-03-14T10:00", "2020-03-14T10:10"),
          steps(400, "2020-03-15T00:00", "2020-03-15T00:10")});
    auto provider = makeSteps();
    show(*provider, QVTimeScope::Week);
    ASSERT_TRUE(waitUntil([&] { return provider->currentValue() == 300; }));
    // Six hours to the west the first walk was on the day before, and tomorrow's is this evening.
    environment->setTimeZone("America/Chicago");
    show(*provider, QVTimeScope::Week);
    ASSERT_TRUE(waitUntil([&] { return provider->currentValue() == 600; }));
    environment->setTimeZone("Europe/Copenhagen");
    environment->setNow(date("2020-03-15T06:00"));
    show(*provider, QVTimeScope::Week);
    ASSERT_TRUE(waitUntil([&] { return provider->currentValue() == 400; }));
}

TEST_F(CumulativeTest, FollowsSavesAndDeletions) {
    auto provider = makeSteps();
    show(*provider, QVTimeScope::Week);
    ASSERT_TRUE(waitUntilLoaded(*provider));
    const int told = delegate->historical;
    save({steps(250, "2020-03-12T10:00", "2020-03-12T10:30")});
    ASSERT_TRUE(
        waitUntil([&] { return provider->historicalData().size() == 7 && provider->averageValue() == 250; }));
    EXPECT_GT(delegate->historical, told);
    deleteAll(VSCode::StepCount);
    ASSERT_TRUE(waitUntil([&] {
        return provider->historicalData().empty() && !provider->averageValue() && !provider->currentValue();
    }));
    EXPECT_TRUE(provider->hasLoadedHistoricalData() && provider->hasLoadedCurrentValue());

    // After a stop nothing is heard; a restart brings what was missed.
    provider->stopQueries();
    save({steps(60, "2020-03-12T10:00", "2020-03-12T10:30")});
    drainMainQueue();
    EXPECT_TRUE(provider->historicalData().empty());
    provider->restartQueries();
    ASSERT_TRUE(waitUntil([&] { return provider->averageValue() == 60 && provider->currentValue() == 60; }));
}

TEST_F(CumulativeTest, AScopeThatIsLeftKeepsItsPointsAndItsAverageFresh) {
    save({steps(240, "2020-03-14T10:00", "2020-03-14T10:30")});
    auto provider = makeSteps();
    show(*provider, QVTimeScope::Day);
    ASSERT_TRUE(waitUntilLoaded(*provider));
    show(*provider, QVTimeScope::Week);
    ASSERT_TRUE(waitUntilLoaded(*provider));
    save({steps(60, "2020-03-14T11:00", "2020-03-14T11:30")});
    ASSERT_TRUE(waitUntil([&] { return provider->averageValue() == 300; }));
    ASSERT_TRUE(waitUntil([&] {
        provider->setStartDate(provider->startDate(), provider->endDate(), QVTimeScope::Day);
        const bool fresh = provider->averageValue() == 300;
        provider->setStartDate(provider->startDate(), provider->endDate(), QVTimeScope::Week);
        return fresh;
    })) << "the day's average goes on while the week is shown";
    show(*provider, QVTimeScope::Day);
    EXPECT_EQ(provider->historicalData().size(), 24u) << "shown at once, refreshed behind";
    EXPECT_TRUE(provider->hasLoadedHistoricalData());
    ASSERT_TRUE(waitUntil([&] { return yValues(*provider)[11] == 60; }));
}

TEST_F(CumulativeTest, TheWeekBeginsAtTheStartOfItsDayAlsoWhenTheClocksSkipMidnightToday) {
    environment->setTimeZone("America/Santiago");
    environment->setNow(date("2025-09-07T12:00"));  // began at 01:00
    save({steps(1000, "2025-09-01T00:15", "2025-09-01T00:15"),
          steps(10, "2025-09-01T15:00", "2025-09-01T15:05"),
          steps(100, "2025-09-03T10:00", "2025-09-03T10:30")});
    auto provider = makeSteps();
    show(*provider, QVTimeScope::Week);
    ASSERT_TRUE(waitUntilLoaded(*provider));
    EXPECT_EQ(provider->secondaryValueText().plainText(), "Daily Average: 555");
    const std::optional<double> none;
    EXPECT_EQ(yValues(*provider),
              (std::vector<std::optional<double>>{1010, none, 100, none, none, none, none}));
    EXPECT_EQ(provider->historicalData()[2]->xValue(), date("2025-09-03T12:00"));
}

TEST_F(CumulativeTest, TheCurrentValueIsDatedWithinItsOwnDay) {
    save({steps(300, "2020-03-13T10:00", "2020-03-13T10:10"),
          steps(60, "2020-03-13T23:30", "2020-03-14T00:30")});
    auto provider = makeSteps();
    show(*provider, QVTimeScope::Week);
    ASSERT_TRUE(waitUntil([&] { return provider->hasLoadedCurrentValue(); }));
    EXPECT_EQ(provider->currentValue(), 330);
    EXPECT_EQ(provider->lastUpdatedDate(), date("2020-03-13T23:59:59"));
    // A total of the whole of today is known until now.
    save({steps(500, "2020-03-14T00:00", "2020-03-15T00:00")});
    ASSERT_TRUE(waitUntil([&] { return provider->currentValue() == 530; }));
    EXPECT_EQ(provider->lastUpdatedDate(), environment->now());
}

class CumulativeInOddZones : public CumulativeTest,
                             public testing::WithParamInterface<std::pair<const char*, const char*>> {};

// Evenings after days on which the clocks changed, some at midnight.
INSTANTIATE_TEST_SUITE_P(Zones, CumulativeInOddZones,
                         testing::Values(std::pair("Europe/Copenhagen", "2020-03-31T20:00"),
                                         std::pair("America/Santiago", "2025-09-07T20:00"),
                                         std::pair("America/Havana", "2019-11-03T20:00"),
                                         std::pair("Pacific/Apia", "2012-01-05T20:00"),
                                         std::pair("Australia/Lord_Howe", "2019-10-08T20:00")));

TEST_P(CumulativeInOddZones, AgreesWithTheDefinitionOnRandomHistories) {
    environment->setTimeZone(GetParam().first);
    environment->setNow(date(GetParam().second));
    std::mt19937 random(20200331);
    std::vector<VSSamplePtr> samples;
    const VSDate first = environment->now() - std::chrono::hours(40 * 24);
    for (int i = 0; i < 400; ++i) {
        const VSDate start = first + std::chrono::minutes(random() % (40 * 24 * 60));
        const VSDate end = start + std::chrono::minutes(random() % 300);
        samples.push_back(std::make_shared<VSQuantitySample>(
            type(VSCode::StepCount), VSQuantity(VSUnit::countUnit(), 1 + random() % 900), start, end));
    }
    save(samples);
    const VSCalendar calendar = VSCalendar::current();
    const DaysOfICU icu(GetParam().first);
    const std::pair<QVTimeScope, VSDateComponents> scopes[] = {{QVTimeScope::Day, {.hours = 1}},
                                                               {QVTimeScope::Week, {.days = 1}},
                                                               {QVTimeScope::Month, {.days = 1}},
                                                               {QVTimeScope::Year, {.months = 1}}};
    for (const auto& [scope, interval] : scopes) {
        auto provider = makeSteps();
        show(*provider, scope);
        ASSERT_TRUE(waitUntilLoaded(*provider));
        const auto borders = calendar.bucketBoundaries(*provider->startDate(), interval,
                                                       *provider->startDate(), *provider->endDate());
        ASSERT_EQ(provider->historicalData().size(), borders.size() - 1);
        for (size_t i = 0; i + 1 < borders.size(); ++i) {
            bool any = false;
            const double expected = oracleTotal(samples, borders[i], borders[i + 1], &any);
            const auto y = provider->historicalData()[i]->maxYValue();
            EXPECT_EQ(y.has_value(), any) << i;
            EXPECT_NEAR(y.value_or(0), expected, 1e-6 * std::max(1.0, expected)) << i;
        }
        double sum = 0;
        int days = 0;
        const auto span = scope == QVTimeScope::Day
                              ? QVTimeScopeSpan(QVTimeScope::Week, VSEnvironment::current()->now(), false)
                              : QVTimeScopeSpan(scope, VSEnvironment::current()->now(), false);
        for (VSDate day = span->start, next; day < span->end; day = next) {
            bool any = false;
            next = icu.startOfDay(day + std::chrono::hours(30));
            sum += oracleTotal(samples, day, next, &any);
            days += any;
        }
        EXPECT_NEAR(*provider->averageValue(), sum / days, 1e-6 * sum / days);
    }
}
