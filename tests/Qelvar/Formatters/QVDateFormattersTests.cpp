#include "Qelvar/Formatters/QVDateFormatters.h"

#include <gtest/gtest.h>

#include <thread>

#include "TestSupport.h"

namespace {

using test::date;

std::string lastUpdated(const std::string& when) {
    return QVLastUpdatedString(date(when)).toStdString();
}

TEST(QVDateFormatters, HourOfDayFollowsTheClockOfTheLocale) {
    const auto hour = [](const char* locale, const char* when) {
        test::FixedEnvironment environment("2020-03-31T20:00", "Asia/Kathmandu", locale);
        return QVHourOfDayFormatter().stringFromDate(date(when)).toStdString();
    };
    EXPECT_EQ(hour("en_US", "2020-03-31T00:00"), "12 AM");
    EXPECT_EQ(hour("en_US", "2020-03-31T15:00"), "3 PM");
    EXPECT_EQ(hour("de_DE", "2020-03-31T15:00"), "15");
    EXPECT_EQ(hour("de_DE", "2020-03-31T09:00"), "9");
    EXPECT_EQ(hour("en_US@hours=h23", "2020-03-31T15:00"), "15");
    EXPECT_EQ(hour("ar_EG", "2020-03-31T15:00"), "٣ م");
    EXPECT_EQ(hour("hi_IN", "2020-03-31T15:00"), "3 pm");
}

TEST(QVDateFormatters, TimeOfDayAndMonthDayTime) {
    const auto texts = [](const char* locale) {
        test::FixedEnvironment environment("2020-03-31T20:00", "America/New_York", locale);
        const VSDate when = date("2020-03-09T17:05");
        return QVTimeOfDayFormatter().stringFromDate(when).toStdString() + " | " +
               QVMonthDayTimeFormatter().stringFromDate(when).toStdString() + " | " +
               QVMediumDateTimeFormatter().stringFromDate(when).toStdString() + " | " +
               QVShortDateFormatter().stringFromDate(when).toStdString();
    };
    EXPECT_EQ(texts("en_US"), "5:05 PM | Mar 9, 5:05 PM | Mar 9, 2020, 5:05 PM | 3/9/20");
    EXPECT_EQ(texts("en_US@hours=h23"), "17:05 | Mar 9, 17:05 | Mar 9, 2020, 17:05 | 3/9/20");
    EXPECT_EQ(texts("de_DE"), "17:05 | 9. März, 17:05 | 09.03.2020, 17:05 | 09.03.20");
    EXPECT_EQ(texts("hi_IN"), "5:05 pm | 9 मार्च, 5:05 pm | 9 मार्च 2020, 5:05 pm | 9/3/20");
    EXPECT_EQ(texts("ar_EG"),
              "٥:٠٥ م | ٩ مارس، ٥:٠٥ م | ٠٩\u200f/٠٣\u200f/٢٠٢٠، ٥:٠٥ م | ٩\u200f/٣\u200f/٢٠٢٠");
}

TEST(QVDateFormatters, ZoneIsThatOfTheCall) {
    test::FixedEnvironment environment("2020-03-31T20:00", "Europe/Copenhagen", "de_DE");
    const VSDate when = date("2020-03-31T20:00");
    const QVDateFormatter formatter = QVTimeOfDayFormatter();
    EXPECT_EQ(formatter.stringFromDate(when), "20:00");
    environment->setTimeZone("America/New_York");
    EXPECT_EQ(formatter.stringFromDate(when), "14:00");
    environment->setTimeZone("Asia/Kathmandu");
    EXPECT_EQ(formatter.stringFromDate(when), "23:45");
    environment->setLocale("en_US");
    EXPECT_EQ(formatter.stringFromDate(when), "11:45 PM");
    // The clocks go forward from 2:00 to 3:00, and back from 3:00 to 2:00.
    environment->setTimeZone("Europe/Copenhagen");
    EXPECT_EQ(formatter.stringFromDate(date("2020-03-29T00:59:59Z")), "1:59 AM");
    EXPECT_EQ(formatter.stringFromDate(date("2020-03-29T01:00:00Z")), "3:00 AM");
    EXPECT_EQ(formatter.stringFromDate(date("2020-10-25T00:30:00Z")), "2:30 AM");
    EXPECT_EQ(formatter.stringFromDate(date("2020-10-25T01:30:00Z")), "2:30 AM");
}

TEST(QVDateFormatters, GregorianWhereAnotherCalendarIsUsual) {
    test::FixedEnvironment thai("2020-03-31T20:00", "Asia/Bangkok", "th_TH");
    EXPECT_TRUE(QVMediumDateFormatter().stringFromDate(date("2020-03-09T12:00")).contains("2020"));
}

TEST(QVDateFormatters, RecentDatesLoseTheirYear) {
    test::FixedEnvironment environment("2020-02-29T08:00", "Europe/Copenhagen", "en_US");
    const auto text = [](const char* when) { return QVRecentDateString(date(when)).toStdString(); };
    EXPECT_EQ(text("2020-02-28T17:00"), "Feb 28, 5:00 PM");
    EXPECT_EQ(text("2019-03-01T08:01"), "Mar 1, 8:01 AM");
    EXPECT_EQ(text("2019-02-28T08:00"), "Feb 28, 2019, 8:00 AM");
    EXPECT_EQ(text("2021-06-01T08:00"), "Jun 1, 8:00 AM");
}

TEST(QVDateFormatters, LastUpdatedIsRelativeForTwoDays) {
    test::FixedEnvironment environment("2020-01-02T10:00", "Europe/Copenhagen", "en_US");
    EXPECT_EQ(lastUpdated("2020-01-02T00:00"), "Today, 12:00 AM");
    EXPECT_EQ(lastUpdated("2020-01-01T23:59"), "Yesterday, 11:59 PM");
    EXPECT_EQ(lastUpdated("2019-12-31T23:59"), "12/31/19, 11:59 PM");
    EXPECT_EQ(lastUpdated("2020-01-03T00:00"), "1/3, 12:00 AM");
    environment->setNow(date("2020-06-15T10:00"));
    EXPECT_EQ(lastUpdated("2020-01-02T15:30"), "1/2, 3:30 PM");
    // A day later the text is another one.
    environment->setNow(date("2020-06-16T10:00"));
    EXPECT_EQ(lastUpdated("2020-06-15T10:00"), "Yesterday, 10:00 AM");

    environment->setLocale("de_DE");
    EXPECT_EQ(lastUpdated("2020-06-16T09:00"), "Heute, 09:00");
    EXPECT_EQ(lastUpdated("2019-06-16T09:00"), "16.6.19, 09:00");
    environment->setLocale("ar_EG");
    EXPECT_EQ(lastUpdated("2020-06-15T21:05"), "أمس، ٩:٠٥ م");
    environment->setLocale("hi_IN");
    EXPECT_EQ(lastUpdated("2020-06-16T09:00"), "आज, 9:00 am");
}

TEST(QVDateFormatters, MidnightBetweenTheDaysIsThatOfTheZone) {
    test::FixedEnvironment environment("2020-06-16T00:30", "Asia/Kathmandu", "en_US");
    EXPECT_EQ(lastUpdated("2020-06-15T23:59"), "Yesterday, 11:59 PM");
    environment->setTimeZone("America/New_York");
    EXPECT_EQ(QVLastUpdatedString(VSEnvironment::current()->now()).left(5), "Today");
}

TEST(QVDateFormatters, UsableFromSeveralThreads) {
    test::FixedEnvironment environment("2020-06-16T00:30", "Europe/Copenhagen", "en_US");
    const VSDate when = date("2020-03-09T17:05");
    std::vector<std::thread> threads;
    std::vector<int> wrong(4);
    for (size_t t = 0; t < wrong.size(); ++t)
        threads.emplace_back([&, t] {
            for (int i = 0; i < 200; ++i)
                if (QVMonthDayTimeFormatter().stringFromDate(when + std::chrono::minutes(i % 2)) !=
                    (i % 2 ? "Mar 9, 5:06 PM" : "Mar 9, 5:05 PM"))
                    ++wrong[t];
        });
    for (auto& thread : threads) thread.join();
    EXPECT_EQ(wrong, std::vector<int>(4));
}

}  // namespace
