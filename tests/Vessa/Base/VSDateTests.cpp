#include "Vessa/Base/VSDate.h"

#include <gtest/gtest.h>

#include <cmath>
#include <random>

#include "TestSupport.h"

namespace {

int64_t microsecondsOf(const char* iso) {
    return test::date(iso).microseconds();
}

TEST(VSDate, KeepsEveryMicrosecondThroughSecondsSinceTheReferenceDate) {
    std::mt19937_64 random(1);
    std::uniform_int_distribution<int64_t> between(microsecondsOf("1900-01-01"),
                                                   microsecondsOf("2200-01-01"));
    for (int i = 0; i < 200'000; ++i) {
        const VSDate date = VSDate::fromMicroseconds(between(random));
        const VSDate back = VSDate::fromSecondsSinceReferenceDate(date.secondsSinceReferenceDate());
        ASSERT_EQ(back.microseconds(), date.microseconds());
    }
}

TEST(VSDate, SecondsOfUnusableNumbersStayDates) {
    EXPECT_EQ(VSDate::fromSecondsSinceReferenceDate(0), VSReferenceDate);
    EXPECT_EQ(VSDate::fromSecondsSinceReferenceDate(std::nan("")), VSDate::distantPast());
    EXPECT_EQ(VSDate::fromSecondsSinceReferenceDate(-HUGE_VAL), VSDate::distantPast());
    EXPECT_EQ(VSDate::fromSecondsSinceReferenceDate(1e300), VSDate::distantFuture());
    EXPECT_LT(VSDate::distantPast(), VSDate::fromSecondsSinceReferenceDate(-1.9e12));
    EXPECT_GT(VSDate::distantFuture(), VSDate::fromSecondsSinceReferenceDate(1.9e12));
}

TEST(VSDate, DurationsRoundToTheNearestMicrosecond) {
    EXPECT_EQ(VSDurationFromSeconds(0.1).count(), 100'000);
    EXPECT_EQ(VSDurationFromSeconds(-0.1).count(), -100'000);
    EXPECT_EQ(VSDurationFromSeconds(-1.0000004).count(), -1'000'000);
    EXPECT_EQ(VSDurationFromSeconds(1.0000006).count(), 1'000'001);
    EXPECT_DOUBLE_EQ(VSSecondsFromDuration(VSDuration(-1'500'000)), -1.5);
}

TEST(VSDate, MillisecondsForICUGoTowardsThePast) {
    EXPECT_EQ(VSDate::fromMicroseconds(1999).icuMilliseconds(), 1);
    EXPECT_EQ(VSDate::fromMicroseconds(-1).icuMilliseconds(), -1);
    EXPECT_EQ(VSDate::fromMicroseconds(-1000).icuMilliseconds(), -1);
}

TEST(VSDate, MiddleOfTwoDates) {
    const VSDate a = VSDate::fromSeconds(100), b = VSDate::fromSeconds(200);
    EXPECT_EQ(VSMidDate(a, b), VSDate::fromSeconds(150));
    EXPECT_EQ(VSMidDate(b, a), VSDate::fromSeconds(150));
    EXPECT_LE(VSDate() - VSMidDate(VSDate::distantPast(), VSDate::distantFuture()), VSDuration(1));
}

}  // namespace
