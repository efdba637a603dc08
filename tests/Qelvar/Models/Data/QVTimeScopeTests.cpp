#include "Qelvar/Models/Data/QVTimeScope.h"

#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include "DaysOfICU.h"
#include "Platform/SystemEvents.h"
#include "Qelvar/Models/Data/QVDateCache.h"
#include "Qelvar/Models/Data/QVSelectedTimeScopeController.h"
#include "Qelvar/Models/Data/QVTimePeriod.h"
#include "TestSupport.h"
#include "Vessa/VSObject.h"

// How a failed comparison shows a span.
void PrintTo(const QVDateSpan& value, std::ostream* out) {
    *out << VSISO8601FromDate(value.start, VSCalendar::current()) << " .. "
         << VSISO8601FromDate(value.end, VSCalendar::current());
}

namespace {

using test::date;

QVDateSpan span(const std::string& start, const std::string& end) {
    return {date(start), date(end)};
}

QVDateSpan spanOf(QVTimeScope timeScope, bool noon = false) {
    return QVTimeScopeSpan(timeScope, VSEnvironment::current()->now(), noon).value();
}

TEST(QVTimeScope, NamesAndZoomLevels) {
    test::FixedEnvironment environment;
    EXPECT_EQ(QVTimeScopeDisplayName(QVTimeScope::Year), "Year");
    EXPECT_TRUE(QVTimeScopeDisplayName(QVTimeScope{5}).isNull());
    EXPECT_TRUE(QVTimeScopeDisplayName(QVTimeScope{-1}).isNull());
    for (const auto timeScope : {QVTimeScope::Day, QVTimeScope::Week, QVTimeScope::Month, QVTimeScope::Year})
        EXPECT_EQ(QVTimeScopeForDateZoom(QVDateZoomForTimeScope(timeScope)), timeScope);
    // The hour level comes back as a day, which is the level before it.
    EXPECT_EQ(QVDateZoomForTimeScope(QVTimeScope::Hour), VSDateZoom::Hour);
    EXPECT_EQ(QVTimeScopeForDateZoom(VSDateZoom::Hour), QVTimeScope::Day);
    EXPECT_EQ(QVTimeScopeForDateZoom(VSDateZoom{9}), QVTimeScope::Hour);
}

TEST(QVTimeScope, SpansEndWithTheAnchorsDayOrMonth) {
    test::FixedEnvironment environment("2015-11-16T19:40", "Asia/Kathmandu");
    EXPECT_EQ(spanOf(QVTimeScope::Day), span("2015-11-16T00:00", "2015-11-17T00:00"));
    EXPECT_EQ(spanOf(QVTimeScope::Week), span("2015-11-10T00:00", "2015-11-17T00:00"));
    EXPECT_EQ(spanOf(QVTimeScope::Month), span("2015-10-17T00:00", "2015-11-17T00:00"));
    EXPECT_EQ(spanOf(QVTimeScope::Year), span("2014-12-01T00:00", "2015-11-30T23:59:59"));

    EXPECT_EQ(spanOf(QVTimeScope::Day, true), span("2015-11-15T12:00", "2015-11-16T12:00"));
    EXPECT_EQ(spanOf(QVTimeScope::Week, true), span("2015-11-09T12:00", "2015-11-16T12:00"));
    EXPECT_EQ(spanOf(QVTimeScope::Month, true), span("2015-10-16T12:00", "2015-11-16T12:00"));
    EXPECT_EQ(spanOf(QVTimeScope::Year, true), span("2014-12-01T12:00", "2015-12-01T11:59:59"));

    for (const bool noon : {false, true})
        for (const auto none : {QVTimeScope::Hour, QVTimeScope{5}, QVTimeScope{INT64_MIN}})
            EXPECT_EQ(QVTimeScopeSpan(none, VSEnvironment::current()->now(), noon), std::nullopt);
}

RC_GTEST_PROP(QVTimeScopeSpans, AreMadeOfTheZonesDays, ()) {
    using test::plusDays, test::plusMonths;
    const std::string zone = *rc::gen::elementOf(test::oddZones);
    const test::DaysOfICU days(zone);
    VSDate now = *rc::gen::elementOf(days.changes());
    now = now + std::chrono::minutes(*rc::gen::inRange(-40 * 1440, 40 * 1440));
    // The first and the last moments of a day are the likeliest to be wrong.
    const int edge = *rc::gen::inRange(0, 4);
    if (edge < 2) now = days.startOfDay(now) - VSDuration(edge);
    test::FixedEnvironment environment("2020-03-01T00:00", zone);
    environment->setNow(now);
    RC_LOG() << zone << " " << testing::PrintToString(now) << std::endl;

    const auto today = days.shown(days.startOfDay(now) + std::chrono::hours(3));
    const auto month = today.year() / today.month() / 1;
    const auto noonBefore = [&](VSDate day) { return VSCalendar::current().noonOfDay(day - VSDuration(1)); };
    const VSDate tomorrow = days.start(plusDays(today, 1));
    for (const auto& [scope, length] : {std::pair(QVTimeScope::Day, 1), std::pair(QVTimeScope::Week, 7),
                                        std::pair(QVTimeScope::Month, 31)}) {
        const VSDate start = days.start(plusDays(today, 1 - length));
        RC_ASSERT(spanOf(scope) == (QVDateSpan{start, tomorrow}));
        RC_ASSERT(spanOf(scope, true) == (QVDateSpan{noonBefore(start), noonBefore(tomorrow)}));
    }
    const VSDate lastSecond = days.start(plusMonths(month, 1)) - std::chrono::seconds(1);
    RC_ASSERT(spanOf(QVTimeScope::Year) == (QVDateSpan{days.start(plusMonths(month, -11)), lastSecond}));
}

struct CacheObserver : QVDateCacheObserver {
    void dateCacheDidUpdate(QVDateCache& cache) override {
        ++updates;
        startSeen = cache.startOfDayMidnight();
    }
    int updates = 0;
    std::optional<VSDate> startSeen;
};

TEST(QVDateCache, KeepsItsDatesUntilTheSignificantTimeChange) {
    test::FixedEnvironment environment("2015-11-16T19:40", "Europe/Copenhagen");
    QVDateCache cache;
    auto observer = std::make_shared<CacheObserver>();
    cache.addObserver(observer);
    cache.addObserver(std::make_shared<CacheObserver>());  // gone at once
    const VSDate start = cache.startOfDayMidnight(), noon = cache.startOfWeekNoon();

    environment->setNow(date("2015-11-18T08:00"));
    EXPECT_EQ(cache.startOfDayMidnight(), start);
    EXPECT_EQ(cache.startOfWeekNoon(), noon);
    EXPECT_EQ(cache.endOfDayMidnight(), date("2015-11-17T00:00"));  // follows the start that is cached

    platform::SystemEvents::shared().postSignificantTimeChange();
    EXPECT_EQ(observer->updates, 1);
    EXPECT_EQ(observer->startSeen, date("2015-11-18T00:00"));
    EXPECT_EQ(cache.startOfDayNoon(), date("2015-11-17T12:00"));

    environment->setTimeZone("America/New_York");
    platform::SystemEvents::shared().postSignificantTimeChange();
    EXPECT_EQ(cache.startOfDayMidnight(), date("2015-11-18T00:00"));  // in New York now
    EXPECT_EQ(observer->updates, 2);

    cache.removeObserver(observer.get());
    platform::SystemEvents::shared().postSignificantTimeChange();
    {
        QVDateCache gone;
        gone.addObserver(observer);
    }
    platform::SystemEvents::shared().postSignificantTimeChange();
    EXPECT_EQ(observer->updates, 2);
}

TEST(QVDateCache, LooksUpEveryScopeAndVariant) {
    test::FixedEnvironment environment("2015-11-16T19:40", "Asia/Kathmandu");
    QVDateCache cache;
    for (const bool noon : {false, true}) {
        for (const auto timeScope :
             {QVTimeScope::Day, QVTimeScope::Week, QVTimeScope::Month, QVTimeScope::Year}) {
            EXPECT_EQ(QVDateCacheStartDate(cache, timeScope, noon), spanOf(timeScope, noon).start);
            EXPECT_EQ(QVDateCacheEndDate(cache, timeScope, noon), spanOf(timeScope, noon).end);
        }
        for (const auto none : {QVTimeScope::Hour, QVTimeScope{5}}) {
            EXPECT_EQ(QVDateCacheStartDate(cache, none, noon), std::nullopt);
            EXPECT_EQ(QVDateCacheEndDate(cache, none, noon), std::nullopt);
        }
    }
}

struct ScopeObserver : QVSelectedTimeScopeControllerObserver {
    void timeScopeControllerDidUpdateSelectedTimeScope(QVSelectedTimeScopeController& controller) override {
        seen.push_back(controller.selectedTimeScope());
    }
    std::vector<QVTimeScope> seen;
};

TEST(QVSelectedTimeScopeController, TellsAlsoWhenNothingChanged) {
    QVSelectedTimeScopeController controller;
    EXPECT_EQ(controller.selectedTimeScope(), QVTimeScope::Week);
    auto observer = std::make_shared<ScopeObserver>();
    controller.addObserver(observer);
    controller.setSelectedTimeScope(QVTimeScope::Year);
    controller.setSelectedTimeScope(QVTimeScope::Year);
    EXPECT_EQ(observer->seen, (std::vector{QVTimeScope::Year, QVTimeScope::Year}));
    controller.removeObserver(observer.get());
    controller.setSelectedTimeScope(QVTimeScope::Day);
    EXPECT_EQ(observer->seen.size(), 2u);
}

TEST(QVTimePeriod, IsAValueOfTwoDates) {
    test::FixedEnvironment environment;
    const auto* type = VSObjectType::dataTypeWithCode(VSCode::SleepAnalysis);
    QVTimePeriod period(VSCategorySample(type, 1, date("2020-03-30T23:00"), date("2020-03-31T07:00")));
    EXPECT_EQ(period, QVTimePeriod(date("2020-03-30T23:00"), date("2020-03-31T07:00")));
    EXPECT_EQ(period.description(), "2020-03-30T23:00:00+02:00 - 2020-03-31T07:00:00+02:00");
    QVTimePeriod copy = period;
    copy.setEndDate(date("2020-03-31T08:00"));
    EXPECT_NE(copy, period);
}

}  // namespace
