#include "Platform/SystemEvents.h"

#include <gtest/gtest.h>

#include <QCoreApplication>
#include <QElapsedTimer>
#include <cstdlib>
#include <fstream>

#include "HostBus.h"
#include "Platform/DesktopSettings.h"
#include "Platform/Localization.h"
#include "QtTestSupport.h"
#include "TestSupport.h"
#include "Vessa/Base/VSSystemSettings.h"

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

    test::HostBus& bus_ = test::HostBus::shared();
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
    SystemEvents::shared().start();
    bus_.prepareForSleep(false);
    bus_.timeDateChanged({{"NTP", true}});
    ASSERT_TRUE(bus_.flush());
    EXPECT_EQ(changes_, 0);
    environment->setNow(test::date("2020-03-29T08:00"));
    bus_.prepareForSleep(true);
    ASSERT_TRUE(bus_.flush());
    EXPECT_EQ(changes_, 0);
    bus_.prepareForSleep(false);
    ASSERT_TRUE(test::waitUntil([&] { return changes_ > 0; }));
    environment->setTimeZone("America/New_York");
    bus_.timeDateChanged({{"Timezone", "America/New_York"}});
    bus_.timeDateChanged({{"Timezone", "America/New_York"}});
    ASSERT_TRUE(bus_.flush());
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

/// The system's, with the host's settings in another folder.
class HostEnvironment : public VSEnvironment {
 public:
    explicit HostEnvironment(std::filesystem::path etc) : etc_(std::move(etc)) {}
    VSDate now() const override { return system_.now(); }
    std::string timeZoneIdentifier() const override { return VSTimeZoneFromSystem(std::getenv("TZ"), etc_); }
    std::string localeIdentifier() const override { return system_.localeIdentifier(); }

 private:
    const VSSystemEnvironment system_;
    const std::filesystem::path etc_;
};

/// The host's settings in a folder, and the process's variables as they come from there or not.
class HostSettingsTest : public testing::Test {
 protected:
    HostSettingsTest() {
        for (const char* name : {"LC_ALL", "LC_TIME", "LANG", "TZ"}) {
            const char* value = getenv(name);
            before_.emplace_back(name, value ? value : "");
            unsetenv(name);
        }
        previous_ = VSEnvironment::current();
        QObject::connect(&SystemEvents::shared(), &SystemEvents::localeDidChange, &context_,
                         [this] { ++changes_; });
        QObject::connect(&SystemEvents::shared(), &SystemEvents::significantTimeChange, &context_,
                         [this] { zones_.push_back(VSEnvironment::current()->timeZoneIdentifier()); });
    }
    ~HostSettingsTest() override {
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
        VSEnvironment::install(std::make_shared<HostEnvironment>(etc_));
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
    /// As timedatectl does.
    void linkZone(const std::string& zone) {
        const auto link = folder_.path() / "beside";
        std::filesystem::create_symlink("/usr/share/zoneinfo/" + zone, link);
        std::filesystem::rename(link, etc_ / "localtime");
    }
    static std::string locale() { return VSEnvironment::current()->localeIdentifier(); }

    test::TemporaryFolder folder_;
    std::filesystem::path etc_ = folder_.path() / "etc";
    std::shared_ptr<const VSEnvironment> previous_;
    std::vector<std::pair<const char*, std::string>> before_;
    QObject context_;
    test::HostBus& bus_ = test::HostBus::shared();
    int changes_ = 0, starts_ = 0;
    std::vector<std::string> zones_;  // at each significant change of the time
};

TEST_F(HostSettingsTest, IsFollowedByAProcessThatWasGivenNoneOfItsOwn) {
    begin("en_US.UTF-8", "en_US.utf8");
    bus_.localeChanged({"LANG=en_US.UTF-8"});
    ASSERT_TRUE(bus_.flush());
    EXPECT_EQ(changes_, 0);
    write("locale.conf", "LANG=de_DE.UTF-8\n");
    ASSERT_TRUE(test::waitUntil([this] { return changes_ > 0; }));
    EXPECT_EQ(locale(), "de_DE");
    EXPECT_EQ(platform::localized("DAY"), "Tag");
    write("locale.conf", "LANG=de_DE.UTF-8\nLC_TIME='ar_EG.UTF-8'\n", true);
    ASSERT_TRUE(test::waitUntil([this] { return changes_ > 1; }));
    EXPECT_EQ(locale(), "ar_EG");
    bus_.localeChanged({"LANG=hi_IN.UTF-8", "LC_NUMERIC=de_DE.UTF-8"});
    ASSERT_TRUE(bus_.flush());
    EXPECT_EQ(locale(), "hi_IN");
    std::filesystem::remove(etc_ / "locale.conf");
    write("default/locale", "export LANG=sv_SE.UTF-8\n");
    ASSERT_TRUE(test::waitUntil([] { return locale() == "sv_SE"; }));

    begin("en_US.UTF-8", "fr_FR.UTF-8");
    write("locale.conf", "LANG=de_DE.UTF-8\n");
    bus_.localeChanged({"LANG=ar_EG.UTF-8"});
    ASSERT_TRUE(bus_.flush());
    EXPECT_EQ(locale(), "fr_FR") << "somebody gave the process a locale of its own";
    EXPECT_EQ(changes_, 0);
}

TEST_F(HostSettingsTest, TheDesktopsClockGoesBeforeTheLocales) {
    begin("en_US.UTF-8", "en_US.UTF-8");
    const auto tellClock = [this](const char* format) {
        bus_.setClockFormat(format);
        ASSERT_TRUE(bus_.flush());
    };
    const auto uses24HourClock = [] { return VSEnvironment::current()->uses24HourClock(); };
    tellClock("12h");
    EXPECT_EQ(locale(), "en_US") << "as the locale has it";
    changes_ = 0;
    tellClock("24h");
    EXPECT_EQ(changes_, 1);
    EXPECT_TRUE(uses24HourClock());
    bus_.localeChanged({"LANG=de_DE.UTF-8"});
    ASSERT_TRUE(bus_.flush());
    EXPECT_EQ(locale(), "de_DE");
    tellClock("12h");
    EXPECT_FALSE(uses24HourClock());
    tellClock("as the locale");
    EXPECT_TRUE(uses24HourClock());
}

class SettingReceiver : public QObject {
    Q_OBJECT
 public:
    QVariantList values;
 public slots:
    void told(const QString&, const QString&, const QDBusVariant& value) {
        values.append(platform::unpackedSetting(value.variant()));
    }
};

TEST_F(HostSettingsTest, TheDesktopIsAskedOnceAndThenTells) {
    bus_.setClockFormat("24h");
    ASSERT_TRUE(bus_.flush());
    SettingReceiver receiver;
    platform::listenToDesktopSetting(&receiver, "told", "org.gnome.desktop.interface", "clock-format");
    ASSERT_TRUE(test::waitUntil([&] { return !receiver.values.isEmpty(); }));
    bus_.setClockFormat("12h");
    ASSERT_TRUE(bus_.flush());
    EXPECT_EQ(receiver.values, (QVariantList{"24h", "12h"}));
}

TEST_F(HostSettingsTest, AnotherZoneIsANewDay) {
    begin("en_US.UTF-8", "en_US.UTF-8");
    linkZone("Europe/Copenhagen");
    const auto expectZone = [this](const char* zone) {
        EXPECT_TRUE(test::waitUntil([this] { return !zones_.empty(); }));
        EXPECT_EQ(zones_, std::vector<std::string>{zone});
        zones_.clear();
    };
    expectZone("Europe/Copenhagen");
    linkZone("Asia/Kathmandu");
    expectZone("Asia/Kathmandu");
    linkZone("Asia/Katmandu");  // another name, and so another zone for all that anybody knows
    expectZone("Asia/Katmandu");
    std::filesystem::remove(etc_ / "localtime");
    write("timezone", "America/Santiago\n");
    ASSERT_TRUE(test::waitUntil([this] { return !zones_.empty() && zones_.back() == "America/Santiago"; }));
    zones_.clear();
    write("timezone", "Pacific/Apia\n", true);
    ASSERT_TRUE(test::waitUntil([this] { return !zones_.empty() && zones_.back() == "Pacific/Apia"; }));

    // Where no file is watched, the bus alone tells.
    const test::TemporaryFolder elsewhere;
    SystemEvents::shared().start(elsewhere.path());
    zones_.clear();
    linkZone("Africa/Cairo");
    bus_.timeDateChanged({{"Timezone", "Africa/Cairo"}});
    expectZone("Africa/Cairo");
}

}  // namespace

#include "SystemEventsTests.moc"
