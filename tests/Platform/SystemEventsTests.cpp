#include "Platform/SystemEvents.h"

#include <gtest/gtest.h>

#include <QCoreApplication>
#include <QElapsedTimer>
#include <cstdlib>
#include <fstream>

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

/// The host's settings in a folder, and the process's variables as they come from there or not.
class HostLocaleTest : public testing::Test {
 protected:
    HostLocaleTest() {
        for (const char* name : {"LC_ALL", "LC_TIME", "LANG"}) {
            const char* value = getenv(name);
            before_.emplace_back(name, value ? value : "");
            unsetenv(name);
        }
        previous_ = VSEnvironment::install(std::make_shared<VSSystemEnvironment>());
        QObject::connect(&SystemEvents::shared(), &SystemEvents::localeDidChange, &context_,
                         [this] { ++changes_; });
    }
    ~HostLocaleTest() override {
        SystemEvents::shared().start();  // the real host's again
        VSSystemEnvironment::setHostPreferences(std::nullopt, std::nullopt);
        VSEnvironment::install(previous_);
        for (const auto& [name, value] : before_)
            value.empty() ? unsetenv(name) : setenv(name, value.c_str(), 1);
        platform::loadTranslations();
    }
    void begin(const std::string& hostLanguage, const char* processLanguage) {
        write("locale.conf", "# as installed\nLANG=\"" + hostLanguage + "\"\n");
        setenv("LANG", processLanguage, 1);
        VSSystemEnvironment::setHostPreferences(std::nullopt, std::nullopt);
        // Each start is of another process.
        std::filesystem::rename(etc_, etc_.string() + std::to_string(++starts_));
        etc_ = etc_.string() + std::to_string(starts_);
        SystemEvents::shared().start(etc_);
        changes_ = 0;
    }
    /// Written beside it and renamed, or in place.
    void write(const char* name, const std::string& text, bool inPlace = false) {
        std::filesystem::create_directories((etc_ / name).parent_path());
        const auto path = inPlace ? etc_ / name : folder_.path() / "beside";
        std::ofstream(path) << text;
        if (!inPlace) std::filesystem::rename(path, etc_ / name);
    }
    static void tellOverBus(const QStringList& settings) {
        QMetaObject::invokeMethod(
            &SystemEvents::shared(), "busLocaleChanged", Q_ARG(QString, "org.freedesktop.locale1"),
            Q_ARG(QVariantMap, (QVariantMap{{"Locale", settings}})), Q_ARG(QStringList, {}));
    }
    static void tellClock(const QString& format) {
        QMetaObject::invokeMethod(&SystemEvents::shared(), "busSettingChanged",
                                  Q_ARG(QString, "org.gnome.desktop.interface"),
                                  Q_ARG(QString, "clock-format"), Q_ARG(QDBusVariant, QDBusVariant(format)));
    }
    static std::string locale() { return VSEnvironment::current()->localeIdentifier(); }

    test::TemporaryFolder folder_;
    std::filesystem::path etc_ = folder_.path() / "etc";
    std::shared_ptr<const VSEnvironment> previous_;
    std::vector<std::pair<const char*, std::string>> before_;
    QObject context_;
    int changes_ = 0, starts_ = 0;
};

TEST_F(HostLocaleTest, IsFollowedByAProcessThatWasGivenNoneOfItsOwn) {
    begin("en_US.UTF-8", "en_US.utf8");
    tellOverBus({"LANG=en_US.UTF-8"});
    EXPECT_EQ(changes_, 0);
    write("locale.conf", "LANG=de_DE.UTF-8\n");
    ASSERT_TRUE(test::waitUntil([this] { return changes_ > 0; }));
    EXPECT_EQ(locale(), "de_DE");
    EXPECT_EQ(platform::localized("DAY"), "Tag");
    write("locale.conf", "LANG=de_DE.UTF-8\nLC_TIME='ar_EG.UTF-8'\n", true);
    ASSERT_TRUE(test::waitUntil([this] { return changes_ > 1; }));
    EXPECT_EQ(locale(), "ar_EG");
    tellOverBus({"LANG=hi_IN.UTF-8", "LC_NUMERIC=de_DE.UTF-8"});
    EXPECT_EQ(locale(), "hi_IN");
    std::filesystem::remove(etc_ / "locale.conf");
    write("default/locale", "export LANG=sv_SE.UTF-8\n");
    ASSERT_TRUE(test::waitUntil([] { return locale() == "sv_SE"; }));

    begin("en_US.UTF-8", "fr_FR.UTF-8");
    write("locale.conf", "LANG=de_DE.UTF-8\n");
    tellOverBus({"LANG=ar_EG.UTF-8"});
    EXPECT_EQ(locale(), "fr_FR") << "somebody gave the process a locale of its own";
    EXPECT_EQ(changes_, 0);
}

TEST_F(HostLocaleTest, TheDesktopsClockGoesBeforeTheLocales) {
    begin("en_US.UTF-8", "en_US.UTF-8");
    const auto uses24HourClock = [] { return VSEnvironment::current()->uses24HourClock(); };
    tellClock("12h");
    EXPECT_EQ(changes_, 0) << "as the locale has it";
    EXPECT_EQ(locale(), "en_US");
    tellClock("24h");
    EXPECT_EQ(changes_, 1);
    EXPECT_TRUE(uses24HourClock());
    tellOverBus({"LANG=de_DE.UTF-8"});
    EXPECT_EQ(locale(), "de_DE");
    tellClock("12h");
    EXPECT_FALSE(uses24HourClock());
    tellClock("as the locale");
    EXPECT_TRUE(uses24HourClock());
}

}  // namespace
