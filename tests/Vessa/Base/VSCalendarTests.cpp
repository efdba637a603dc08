#include "Vessa/Base/VSCalendar.h"

#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>
#include <unicode/gregocal.h>

#include <map>
#include <random>

#include "DaysOfICU.h"
#include "TestSupport.h"

namespace {

constexpr int64_t kMinute = 60'000'000, kDay = 1440 * kMinute;

/// The first moment at which the clock shows the local time or has jumped over it. Changes lie on half
/// minutes.
VSDate firstMomentOf(const test::DaysOfICU& clock, int64_t localTime) {
    int64_t time = localTime - 15 * 60 * kMinute;  // no zone is further east
    while (clock.local(time) < localTime) time += kMinute / 2;
    return VSDate::fromMicroseconds(time);
}

int64_t floorToDay(int64_t local) {
    return (local >= 0 ? local / kDay : -((-local + kDay - 1) / kDay)) * kDay;
}

class CalendarOfZone : public testing::TestWithParam<const char*> {
 protected:
    /// Whole minutes, most of them within three days of a change of the clock.
    std::vector<VSDate> interestingDates(int count) {
        const auto& changes = clock.changes();
        std::mt19937_64 random(7);
        std::uniform_int_distribution<int64_t> near(-3 * 1440, 3 * 1440), anywhere(-10'000'000, 35'000'000);
        std::vector<VSDate> dates;
        for (int i = 0; i < count; ++i) {
            const bool quiet = changes.empty() || i % 8 == 0;
            const int64_t minutes =
                quiet ? anywhere(random)
                      : changes[random() % changes.size()].microseconds() / kMinute + near(random);
            dates.push_back(VSDate::fromMicroseconds(minutes * kMinute));
        }
        return dates;
    }

    const test::DaysOfICU clock{GetParam()};
    const VSCalendar calendar{GetParam(), "en_US"};
};

INSTANTIATE_TEST_SUITE_P(Zones, CalendarOfZone,
                         testing::Values("Europe/Copenhagen", "America/New_York", "Asia/Kathmandu",
                                         "Africa/Monrovia", "Pacific/Apia", "America/Sao_Paulo",
                                         "Asia/Beirut", "Australia/Lord_Howe", "America/St_Johns",
                                         "Africa/Casablanca", "GMT+05:45"),
                         [](const auto& zone) {
                             std::string name = zone.param;
                             std::erase_if(
                                 name, [](char c) { return !std::isalnum(static_cast<unsigned char>(c)); });
                             return name;
                         });

TEST_P(CalendarOfZone, AgreesWithTheWallClock) {
    for (const VSDate date : interestingDates(100)) {
        SCOPED_TRACE(VSISO8601FromDate(date, calendar));
        const int64_t local = clock.local(date.microseconds());
        const int64_t day = floorToDay(local);
        EXPECT_EQ(calendar.secondsFromGMT(date) * int64_t{1'000'000}, local - date.microseconds());
        if (date != calendar.startOfDay(date)) {
            EXPECT_EQ(calendar.addDays(date, 1), firstMomentOf(clock, local + kDay));
            EXPECT_EQ(calendar.addDays(date, -3), firstMomentOf(clock, local - 3 * kDay));
        }
        EXPECT_EQ(calendar.component(VSCalendarUnit::Hour, date), (local - day) / kMinute / 60);
        EXPECT_EQ(calendar.component(VSCalendarUnit::Minute, date), (local - day) / kMinute % 60);
        EXPECT_LE(calendar.startOfHour(date), date);
        EXPECT_EQ(calendar.startOfHour(calendar.startOfHour(date)), calendar.startOfHour(date));
        if (testing::Test::HasFailure()) return;
    }
}

TEST_P(CalendarOfZone, AgreesWithTheCalendarOfICU) {
    UErrorCode status = U_ZERO_ERROR;
    icu::GregorianCalendar icu(icu::TimeZone::createTimeZone(icu::UnicodeString(GetParam())),
                               icu::Locale("en_US"), status);
    icu.setGregorianChange(-1e15, status);
    icu.setRepeatedWallTimeOption(UCAL_WALLTIME_FIRST);
    icu.setSkippedWallTimeOption(UCAL_WALLTIME_NEXT_VALID);
    ASSERT_TRUE(U_SUCCESS(status));
    std::mt19937 random(3);
    for (const VSDate date : interestingDates(3000)) {
        SCOPED_TRACE(VSISO8601FromDate(date, calendar));
        const auto fields = [&](VSDate of) {
            icu.setTime(of.icuMilliseconds(), status);
            return std::array{icu.get(UCAL_ERA, status),         icu.get(UCAL_YEAR, status),
                              icu.get(UCAL_MONTH, status) + 1,   icu.get(UCAL_DATE, status),
                              icu.get(UCAL_HOUR_OF_DAY, status), icu.get(UCAL_DAY_OF_WEEK, status)};
        };
        const std::array ours{calendar.component(VSCalendarUnit::Era, date),
                              calendar.component(VSCalendarUnit::Year, date),
                              calendar.component(VSCalendarUnit::Month, date),
                              calendar.component(VSCalendarUnit::Day, date),
                              calendar.component(VSCalendarUnit::Hour, date),
                              calendar.component(VSCalendarUnit::Weekday, date)};
        ASSERT_EQ(ours, fields(date));

        // Months: the fields of ICU's sum, set anew so that gaps and overlaps follow the rule chosen above.
        const int months = static_cast<int>(random() % 61) - 30;
        icu.setTime(date.icuMilliseconds(), status);
        const int hour = icu.get(UCAL_HOUR_OF_DAY, status), minute = icu.get(UCAL_MINUTE, status),
                  second = icu.get(UCAL_SECOND, status);
        icu.set(UCAL_HOUR_OF_DAY, 12);
        icu.add(UCAL_MONTH, months, status);
        const int year = icu.get(UCAL_YEAR, status), month = icu.get(UCAL_MONTH, status),
                  day = icu.get(UCAL_DATE, status);
        icu.clear();
        icu.set(year, month, day, hour, minute, second);
        if (months != 0 && date != calendar.startOfDay(date)) {
            ASSERT_EQ(calendar.addMonths(date, months).icuMilliseconds(), icu.getTime(status))
                << months << " months";
        }
    }
}

const test::DaysOfICU& daysOf(const std::string& zone) {
    static std::map<std::string, std::unique_ptr<test::DaysOfICU>> zones;
    auto& days = zones[zone];
    if (!days) days = std::make_unique<test::DaysOfICU>(zone);
    return *days;
}

/// Most of them near a change of the clock.
VSDate oddMoment(const test::DaysOfICU& days) {
    const auto& changes = days.changes();
    const VSDate near = changes.empty() || *rc::gen::inRange(0, 8) == 0
                            ? VSDate::fromSeconds(*rc::gen::inRange(-600'000'000, 2'100'000'000))
                            : *rc::gen::elementOf(changes);
    return near + VSDuration(*rc::gen::inRange<int64_t>(-40 * 1440, 40 * 1440) * kMinute);
}

std::string said(VSDate date) {
    return testing::PrintToString(date);
}

RC_GTEST_PROP(VSCalendarDays, AreThoseOfICUOneByOne, ()) {
    const std::string zone = *rc::gen::elementOf(test::oddZones);
    const test::DaysOfICU& days = daysOf(zone);
    const VSCalendar calendar(zone, "en_US");
    const VSDate date = oddMoment(days), start = days.startOfDay(date);
    RC_LOG() << zone << " " << said(date) << ", a day from " << said(start) << std::endl;
    RC_ASSERT(calendar.startOfDay(date) == start);
    RC_ASSERT(calendar.startOfDay(start) == start);
    RC_ASSERT(calendar.isSameDay(start, date));
    RC_ASSERT(!calendar.isSameDay(start - VSDuration(1), date));

    const auto day = days.shown(start);
    const int more = *rc::gen::inRange(-40, 41), months = *rc::gen::inRange(-26, 27);
    RC_ASSERT(calendar.addDays(start, more) == days.start(test::plusDays(day, more)));
    RC_ASSERT(calendar.addMonths(start, months) == days.start(test::plusMonths(day, months)));
    RC_ASSERT(calendar.startOfMonth(date) == days.start(day.year() / day.month() / 1));
    // Noon is shown once, and not more than half a day and two hours from the start.
    const VSDate noon = calendar.noonOfDay(date), before = calendar.yesterdayAtNoon(date);
    RC_ASSERT(days.local(noon.microseconds()) % kDay ==
              (kDay / 2) % kDay - (days.local(noon.microseconds()) < 0 ? kDay : 0));
    RC_ASSERT(days.startOfDay(noon) == start);
    RC_ASSERT(before == calendar.noonOfDay(start - VSDuration(1)));
}

RC_GTEST_PROP(VSCalendarDays, EveryWeekMonthAndYearIsMadeOfThem, ()) {
    const std::string zone = *rc::gen::elementOf(test::oddZones);
    const test::DaysOfICU& days = daysOf(zone);
    const VSCalendar calendar(zone, "en_US");
    const VSDateComponents interval = *rc::gen::elementOf(
        std::vector<VSDateComponents>{{.days = 1}, {.days = 7}, {.months = 1}, {.years = 1}});
    const VSDate anchor = days.startOfDay(oddMoment(days)), from = oddMoment(days);
    const VSDate to =
        from +
        VSDuration(*rc::gen::inRange<int64_t>(1, 800 * (interval.days ? interval.days : 60)) * 60 * kMinute);
    RC_LOG() << zone << " " << said(from) << " to " << said(to) << ", from " << said(anchor) << std::endl;
    const auto boundary = [&](int n) {
        const auto day = test::plusMonths(days.shown(anchor), n * (12 * interval.years + interval.months));
        return days.start(test::plusDays(day, n * interval.days));
    };
    const auto length =
        std::chrono::hours(24) * (interval.days + 30 * interval.months + 365 * interval.years);
    int n = static_cast<int>((from - anchor) / length);
    while (boundary(n) > from) --n;
    while (boundary(n + 1) <= from) ++n;
    std::vector<VSDate> expected{boundary(n)};
    while (expected.back() < to)
        if (const VSDate next = boundary(++n); next > expected.back()) expected.push_back(next);
    RC_ASSERT(calendar.bucketBoundaries(anchor, interval, from, to) == expected);
}

TEST(VSCalendar, ADayThatAZoneLeftOut) {
    const VSCalendar apia("Pacific/Apia", "en_WS");  // went from 29 to 31 December 2011
    const VSDate before = *apia.date(2011, 12, 29), after = *apia.date(2011, 12, 31);
    EXPECT_EQ(after - before, std::chrono::hours(24));
    EXPECT_EQ(apia.date(2011, 12, 30), after);
    EXPECT_EQ(apia.addDays(before, 1), after);
    EXPECT_EQ(apia.yesterdayAtNoon(after), apia.date(2011, 12, 29, 12));
    const auto days =
        apia.bucketBoundaries(*apia.date(2011, 12, 1), {.days = 1}, before, *apia.date(2012, 1, 2));
    EXPECT_EQ(days, (std::vector{before, after, *apia.date(2012, 1, 1), *apia.date(2012, 1, 2)}));
}

TEST(VSCalendar, HoursAcrossAChangeOfTheClock) {
    const VSCalendar newYork("America/New_York", "en_US"), lordHowe("Australia/Lord_Howe", "en_AU");
    const auto hour = [](const VSCalendar& calendar, const char* text) {
        return VSISO8601FromDate(calendar.startOfHour(*VSDateFromISO8601(text, calendar)), calendar);
    };
    EXPECT_EQ(hour(newYork, "2020-11-01T01:30:00-04:00"), "2020-11-01T01:00:00-04:00");
    EXPECT_EQ(hour(newYork, "2020-11-01T01:30:00-05:00"), "2020-11-01T01:00:00-05:00");
    EXPECT_EQ(hour(lordHowe, "2020-10-04T02:45:00"),
              "2020-10-04T02:30:00+11:00");  // the clock jumped to 2:30
    const VSDate late = *VSDateFromISO8601("2020-10-31T23:59:59.999999", newYork);
    EXPECT_EQ(newYork.add(late, {.hours = 3}) - late, std::chrono::hours(3));
    EXPECT_EQ(VSISO8601FromDate(newYork.add(late, {.days = 1}), newYork), "2020-11-01T23:59:59.999999-05:00");
    // Nothing added to the second of two equal hours gives that hour again.
    const VSDate second = *VSDateFromISO8601("2020-11-01T01:30:00-05:00", newYork);
    EXPECT_EQ(newYork.add(second, {}), second);
}

TEST(VSCalendar, MonthsKeepTheDayWhereItExists) {
    const VSCalendar calendar("Europe/Copenhagen", "da_DK");
    const VSDate last = *calendar.date(2020, 1, 31, 10);
    EXPECT_EQ(calendar.addMonths(last, 1), calendar.date(2020, 2, 29, 10));
    EXPECT_EQ(calendar.addMonths(last, -11), calendar.date(2019, 2, 28, 10));
    EXPECT_EQ(calendar.add(last, {.years = 1, .months = 1, .days = 1}), calendar.date(2021, 3, 1, 10));
    EXPECT_EQ(calendar.startOfMonth(last), calendar.date(2020, 1, 1));
    // March 2020 is an hour short: its middle is half an hour before that of 31 whole days.
    EXPECT_EQ(calendar.middleOfMonth(*calendar.date(2020, 3, 5)), *calendar.date(2020, 3, 16, 11, 30));
    const auto months = calendar.bucketBoundaries(last, {.months = 1}, *calendar.date(2020, 2, 1),
                                                  *calendar.date(2020, 4, 30));
    EXPECT_EQ(months, (std::vector{last, *calendar.date(2020, 2, 29, 10), *calendar.date(2020, 3, 31, 10),
                                   *calendar.date(2020, 4, 30, 10)}));
}

TEST(VSCalendar, BucketsCoverTheRangeFromEitherSideOfTheAnchor) {
    std::mt19937_64 random(11);
    const std::array<VSDateComponents, 3> intervals{
        {{.hours = 1}, {.minutes = 15}, {.months = 1, .days = 3, .hours = 5}}};
    for (const char* zone :
         {"Europe/Copenhagen", "America/Sao_Paulo", "Australia/Lord_Howe", "Pacific/Apia"}) {
        const VSCalendar calendar(zone, "en_US");
        for (int i = 0; i < 400; ++i) {
            const auto& interval = intervals[random() % intervals.size()];
            const bool fine = interval.days == 0 && interval.months == 0 && interval.years == 0;
            const auto years = [&](int from, int to) {
                return VSDate::fromSeconds(
                    (from + static_cast<int64_t>(random() % static_cast<uint64_t>(to - from))) * 31'557'600 +
                    static_cast<int64_t>(random() % 31'000'000));
            };
            const VSDate anchor = calendar.startOfDay(years(-5, 60)), start = years(20, 50);
            const VSDate end =
                start + VSDuration(1 + static_cast<int64_t>(random() % (fine ? 30 : 3000)) * kDay / 2);
            const auto dates = calendar.bucketBoundaries(anchor, interval, start, end);
            SCOPED_TRACE(std::string(zone) + " " + VSISO8601FromDate(start, calendar) + " to " +
                         VSISO8601FromDate(end, calendar));
            ASSERT_GE(dates.size(), 2U);
            EXPECT_LE(dates.front(), start);
            EXPECT_GT(dates[1], start);
            EXPECT_GE(dates.back(), end);
            EXPECT_LT(dates[dates.size() - 2], end);
            ASSERT_EQ(std::adjacent_find(dates.begin(), dates.end(), std::greater_equal<>()), dates.end());
            // A range that begins on a border begins with it.
            const VSDate border = dates[dates.size() / 2];
            ASSERT_EQ(calendar.bucketBoundaries(anchor, interval, border, border + VSDuration(kDay)).front(),
                      border);
        }
    }
}

TEST(VSCalendar, LocalDatesThatDoNotExistAreRefused) {
    const VSCalendar calendar("Europe/Copenhagen", "da_DK");
    EXPECT_FALSE(calendar.date(2021, 2, 29));
    EXPECT_FALSE(calendar.date(1900, 2, 29));
    EXPECT_TRUE(calendar.date(2000, 2, 29));
    EXPECT_FALSE(calendar.date(2021, 0, 1));
    EXPECT_FALSE(calendar.date(2021, 13, 1));
    EXPECT_FALSE(calendar.date(2021, 4, 31));
    EXPECT_FALSE(calendar.date(2021, 4, 1, 24));
    EXPECT_FALSE(calendar.date(2021, 4, 1, 0, 0, 60));
    EXPECT_EQ(calendar.date(2021, 3, 28, 2, 30), calendar.date(2021, 3, 28, 3));  // in the gap
}

TEST(VSCalendar, WholeYearsAreCountedAsBirthdays) {
    const VSCalendar calendar("Europe/Copenhagen", "da_DK");
    const VSDate born = *calendar.date(1980, 2, 29);
    EXPECT_EQ(calendar.wholeYearsBetween(born, *calendar.date(2020, 2, 28)), 39);
    EXPECT_EQ(calendar.wholeYearsBetween(born, *calendar.date(2020, 2, 29)), 40);
    EXPECT_EQ(calendar.wholeYearsBetween(born, *calendar.date(2021, 2, 28)), 41);
    EXPECT_EQ(calendar.wholeYearsBetween(*calendar.date(2020, 2, 29), born), -40);
    EXPECT_EQ(calendar.wholeYearsBetween(born, born), 0);
}

TEST(VSCalendar, DistantDatesAreReckonedToo) {
    const VSCalendar calendar("America/New_York", "en_US");
    EXPECT_EQ(VSISO8601FromDate(*calendar.date(2755, 7, 1, 12), calendar), "2755-07-01T12:00:00-04:00");
    EXPECT_EQ(VSISO8601FromDate(*calendar.date(2755, 1, 1, 12), calendar), "2755-01-01T12:00:00-05:00");
    EXPECT_EQ(calendar.component(VSCalendarUnit::Year, *calendar.date(0, 6, 1)), 1);
    EXPECT_EQ(calendar.component(VSCalendarUnit::Era, *calendar.date(0, 6, 1)), 0);
    for (const VSDate date : {VSDate::distantPast(), VSDate::distantFuture()}) {
        const VSDate day = calendar.startOfDay(date);
        EXPECT_LE(day, date);
        EXPECT_LT(date - day, std::chrono::hours(25));
    }
}

TEST(VSCalendar, WeeksFollowTheLocale) {
    const auto week = [](const char* locale) { return VSCalendar("Etc/UTC", locale); };
    EXPECT_EQ(week("en_US").firstWeekday(), 1);
    EXPECT_EQ(week("da_DK").firstWeekday(), 2);
    EXPECT_EQ(week("ar_EG").firstWeekday(), 7);
    EXPECT_EQ(week("en_US").weekendDays(), (std::vector{1, 7}));
    EXPECT_EQ(week("ar_EG").weekendDays(), (std::vector{6, 7}));
    EXPECT_EQ(week("fa_IR").weekendDays(), (std::vector{6}));
}

TEST(VSCalendar, TodayAndYesterdayFollowClockAndZone) {
    test::FixedEnvironment environment("2020-03-31T23:30", "Europe/Copenhagen");
    const VSDate now = environment->now();
    EXPECT_TRUE(VSCalendar::current().isToday(now - std::chrono::hours(23)));
    EXPECT_TRUE(VSCalendar::current().isYesterday(now - std::chrono::hours(24)));
    EXPECT_FALSE(VSCalendar::current().isYesterday(now - std::chrono::hours(48)));
    environment->setTimeZone("Asia/Kathmandu");  // there it is already 1 April
    EXPECT_EQ(VSCalendar::current().component(VSCalendarUnit::Day, now), 1);
    EXPECT_TRUE(VSCalendar::current().isYesterday(now - std::chrono::hours(23)));
    environment->setNow(now + std::chrono::hours(24));
    EXPECT_TRUE(VSCalendar::current().isYesterday(now));
}

}  // namespace
