#include "Platform/SystemEvents.h"

#include <gtest/gtest.h>

#include <QCoreApplication>
#include <QElapsedTimer>

#include "Platform/Localization.h"
#include "QtTestSupport.h"
#include "TestSupport.h"

namespace {

using platform::SystemEvents;

class SystemEventsTest : public testing::Test {
 protected:
    SystemEventsTest() {
        QObject::connect(&SystemEvents::shared(), &SystemEvents::significantTimeChange, &context_,
                         [this] { ++changes_; });
    }
    // Lets the armed timer fire several times over: an event too many would show.
    void runTimersFor(int milliseconds) {
        QElapsedTimer timer;
        timer.start();
        test::waitUntil([&] { return timer.hasExpired(milliseconds); });
    }

    QObject context_;
    int changes_ = 0;
};

TEST_F(SystemEventsTest, MidnightIsOneEventAndTheNextIsWaitedFor) {
    test::FixedEnvironment environment("2020-03-28T23:59:59.950", "Europe/Copenhagen");
    SystemEvents::shared().start();
    // The timer fires, but the clock has not come to midnight: no event.
    runTimersFor(150);
    EXPECT_EQ(changes_, 0);
    environment->setNow(test::date("2020-03-29T00:00:00.001"));
    ASSERT_TRUE(test::waitUntil([&] { return changes_ > 0; }));
    runTimersFor(100);
    EXPECT_EQ(changes_, 1);

    // The day of 23 hours ends as well.
    environment->setNow(test::date("2020-03-29T23:59:59.950"));
    SystemEvents::shared().start();
    environment->setNow(test::date("2020-03-30T00:00:00"));
    ASSERT_TRUE(test::waitUntil([&] { return changes_ > 1; }));
    EXPECT_EQ(changes_, 2);
}

TEST_F(SystemEventsTest, ZoneChangeOnTheSameDayIsAnEvent) {
    test::FixedEnvironment environment("2020-03-28T23:59:59.950", "Europe/Copenhagen");
    SystemEvents::shared().start();
    environment->setTimeZone("Africa/Johannesburg");  // an hour on: there it is tomorrow
    ASSERT_TRUE(test::waitUntil([&] { return changes_ > 0; }));
    environment->setNow(test::date("2020-03-29T23:59:59.950"));
    SystemEvents::shared().start();
    environment->setTimeZone("Europe/Tallinn");  // the same offset and day
    ASSERT_TRUE(test::waitUntil([&] { return changes_ > 1; }));
    runTimersFor(60);
    EXPECT_EQ(changes_, 2);
}

TEST_F(SystemEventsTest, WhatTheBusTellsIsCheckedAgainstTheClock) {
    test::FixedEnvironment environment("2020-03-28T12:00", "Europe/Copenhagen");
    auto* events = &SystemEvents::shared();
    events->start();
    // By the names that the bus is given.
    const auto resume = [&](bool goingToSleep) {
        return QMetaObject::invokeMethod(events, "busPrepareForSleep", Q_ARG(bool, goingToSleep));
    };
    const auto timeDateChange = [&] {
        return QMetaObject::invokeMethod(events, "busTimeDateChanged",
                                         Q_ARG(QString, "org.freedesktop.timedate1"), Q_ARG(QVariantMap, {}),
                                         Q_ARG(QStringList, {}));
    };
    EXPECT_TRUE(resume(false));
    EXPECT_TRUE(timeDateChange());
    EXPECT_EQ(changes_, 0);
    environment->setNow(test::date("2020-03-29T08:00"));
    resume(true);
    EXPECT_EQ(changes_, 0);
    resume(false);
    EXPECT_EQ(changes_, 1);
    environment->setTimeZone("America/New_York");
    timeDateChange();
    timeDateChange();
    EXPECT_EQ(changes_, 2);
}

TEST_F(SystemEventsTest, LocaleChangeLoadsTheTextsFirst) {
    test::FixedEnvironment environment("2020-03-28T12:00", "Europe/Copenhagen", "en_US");
    QString seen;
    QObject::connect(&SystemEvents::shared(), &SystemEvents::localeDidChange, &context_,
                     [&] { seen = qtTrId("DAY"); });
    environment->setLocale("de_DE");
    SystemEvents::shared().postLocaleChange();
    EXPECT_EQ(seen, "Tag");
    environment->setLocale("en_US");
    SystemEvents::shared().postLocaleChange();
    EXPECT_EQ(seen, "Day");
}

}  // namespace
