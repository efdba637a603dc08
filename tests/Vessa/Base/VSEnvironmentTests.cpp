#include "Vessa/Base/VSEnvironment.h"

#include <gtest/gtest.h>
#include <stdlib.h>

#include <fstream>

#include "TestSupport.h"
#include "Vessa/Base/VSCalendar.h"
#include "Vessa/Base/VSSystemSettings.h"

namespace {

TEST(VSSystemSettings, ZonesOfTheVariable) {
    const auto zone = [](const char* tz) { return VSTimeZoneFromSystem(tz, "/nonexistent"); };
    EXPECT_EQ(zone("Europe/Paris"), "Europe/Paris");
    EXPECT_EQ(zone(":Europe/Paris"), "Europe/Paris");
    EXPECT_EQ(zone(":/usr/share/zoneinfo/Asia/Kathmandu"), "Asia/Kathmandu");
    EXPECT_EQ(zone("/usr/share/zoneinfo/right/Asia/Kathmandu"), "Asia/Kathmandu");
    EXPECT_EQ(zone("EST5EDT"), "EST5EDT");
    EXPECT_EQ(zone("CET-1CEST,M3.5.0,M10.5.0/3"), "Europe/Paris");
    EXPECT_EQ(zone("<+0545>-5:45"), "GMT+05:45");
    EXPECT_EQ(zone("XYZ3:30"), "GMT-03:30");
    EXPECT_EQ(zone("UTC0"), "Etc/UTC");
    for (const char* useless : {"", "No/Such_Zone", ":", "<+05", "AB3", "XYZ25", "/etc/passwd"})
        EXPECT_EQ(zone(useless), "Etc/UTC") << useless;
    EXPECT_EQ(VSCalendar(zone("<+0545>-5:45"), "en").secondsFromGMT(VSDate()), 20'700);
}

TEST(VSSystemSettings, ZonesOfTheFiles) {
    const test::TemporaryFolder etc;
    const auto zone = [&etc] { return VSTimeZoneFromSystem(nullptr, etc.path()); };
    EXPECT_EQ(zone(), "Etc/UTC");
    std::ofstream(etc.path() / "timezone") << "Asia/Tokyo\n";
    EXPECT_EQ(zone(), "Asia/Tokyo");
    std::ofstream(etc.path() / "localtime") << "a copy and not a link";
    EXPECT_EQ(zone(), "Asia/Tokyo");
    std::filesystem::remove(etc.path() / "localtime");
    std::filesystem::create_symlink("localtime.real", etc.path() / "localtime");
    std::filesystem::create_symlink("../usr/share/zoneinfo/Europe/Copenhagen", etc.path() / "localtime.real");
    EXPECT_EQ(zone(), "Europe/Copenhagen");
    std::filesystem::remove(etc.path() / "localtime");
    std::filesystem::create_symlink("localtime", etc.path() / "localtime");  // a circle
    EXPECT_EQ(zone(), "Asia/Tokyo");
}

TEST(VSSystemSettings, LocalesOfPOSIX) {
    EXPECT_EQ(VSLocaleFromPOSIX("da_DK.UTF-8"), "da_DK");
    EXPECT_EQ(VSLocaleFromPOSIX("ar_EG"), "ar_EG");
    EXPECT_EQ(VSLocaleFromPOSIX("de"), "de");
    EXPECT_EQ(VSLocaleFromPOSIX("de_DE.ISO-8859-15@euro"), "de_DE");
    EXPECT_EQ(VSLocaleFromPOSIX("sr_RS.UTF-8@latin"), "sr_Latn_RS");
    for (const char* none : {"C", "POSIX", "C.UTF-8", "", ".UTF-8", "@euro", "12", "../../etc"})
        EXPECT_EQ(VSLocaleFromPOSIX(none), "en_US") << none;
    EXPECT_EQ(VSLocaleFromPOSIX(nullptr), "en_US");
}

/// Sets variables of the process for the life of the object.
class Variables {
 public:
    explicit Variables(const std::vector<std::pair<const char*, const char*>>& values) {
        for (const auto& [name, value] : values) {
            const char* old = getenv(name);
            before_.emplace_back(name, old ? std::optional<std::string>(old) : std::nullopt);
            set(name, value);
        }
    }
    ~Variables() {
        for (const auto& [name, value] : before_) set(name, value ? value->c_str() : nullptr);
    }

 private:
    static void set(const char* name, const char* value) { value ? setenv(name, value, 1) : unsetenv(name); }
    std::vector<std::pair<const char*, std::optional<std::string>>> before_;
};

TEST(VSSystemEnvironment, ReadsTheVariablesAnewAndPrefersTheStronger) {
    const VSSystemEnvironment environment;
    const Variables variables(
        {{"LC_ALL", nullptr}, {"LC_TIME", "da_DK.UTF-8"}, {"LANG", "fr_FR.UTF-8"}, {"TZ", "Asia/Tokyo"}});
    EXPECT_EQ(environment.localeIdentifier(), "da_DK");
    EXPECT_EQ(environment.timeZoneIdentifier(), "Asia/Tokyo");
    const Variables stronger({{"LC_ALL", "sv_SE"}, {"TZ", ":America/Lima"}});
    EXPECT_EQ(environment.localeIdentifier(), "sv_SE");
    EXPECT_EQ(environment.timeZoneIdentifier(), "America/Lima");
    const Variables weaker({{"LC_ALL", ""}, {"LC_TIME", nullptr}});
    EXPECT_EQ(environment.localeIdentifier(), "fr_FR");
}

TEST(VSSystemEnvironment, AClockSetElsewhereRunsOn) {
    const VSDate start = VSDate::fromSeconds(1'585'684'800);
    const VSSystemEnvironment environment(start);
    const VSDate first = environment.now();
    EXPECT_GE(first, start);
    EXPECT_LT(first - start, std::chrono::minutes(10));
    VSDate later = first;
    for (int i = 0; later == first && i < 100'000'000; ++i) later = environment.now();
    EXPECT_GT(later, first);
}

TEST(VSEnvironment, InstallingGivesTheOneBefore) {
    const auto before = VSEnvironment::current();
    const auto fixed = std::make_shared<VSFixedEnvironment>(VSDate(), "Etc/UTC", "en_US");
    EXPECT_EQ(VSEnvironment::install(fixed), before);
    EXPECT_EQ(VSEnvironment::current(), fixed);
    EXPECT_EQ(VSEnvironment::install(nullptr), fixed);  // the system's
    EXPECT_NE(VSEnvironment::current(), nullptr);
    VSEnvironment::install(before);
}

TEST(VSEnvironment, HoursFollowTheLocale) {
    test::FixedEnvironment environment;
    EXPECT_FALSE(environment->uses24HourClock());
    environment->setLocale("da_DK");
    EXPECT_TRUE(environment->uses24HourClock());
    environment->setLocale("ar_EG");
    EXPECT_FALSE(environment->uses24HourClock());
}

}  // namespace
