#include <gtest/gtest.h>

#include <random>

#include "Vessa/Base/VSCalendar.h"

namespace {

const VSCalendar kCopenhagen("Europe/Copenhagen", "da_DK");
const VSCalendar kUTC("Etc/UTC", "en_US");

std::string inUTC(const char* text) {
    const auto date = VSDateFromISO8601(text, kCopenhagen);
    return date ? VSISO8601FromDate(*date, kUTC) : "none";
}

TEST(VSISO8601, ReadsWhatItShould) {
    EXPECT_EQ(inUTC("2020-03-31"), "2020-03-30T22:00:00+00:00");
    EXPECT_EQ(inUTC("2020-03-31T20:00"), "2020-03-31T18:00:00+00:00");
    EXPECT_EQ(inUTC("2020-03-31T20:00:01"), "2020-03-31T18:00:01+00:00");
    EXPECT_EQ(inUTC("2020-03-31T20:00:01.25Z"), "2020-03-31T20:00:01.250000+00:00");
    EXPECT_EQ(inUTC("2020-03-31T20:00:00.1234567-0230"), "2020-03-31T22:30:00.123457+00:00");
    EXPECT_EQ(inUTC("2020-03-31T20:00+05:45"), "2020-03-31T14:15:00+00:00");
    EXPECT_EQ(inUTC("1969-12-31T23:59:59.999999Z"), "1969-12-31T23:59:59.999999+00:00");
}

TEST(VSISO8601, RefusesEverythingElse) {
    // clang-format off
    const char* const texts[] = {
        "", "2020", "2020-03", "2020-3-31", "20200331", "2020-02-30", "2020-03-31T", "2020-03-31 20:00",
        "2020-03-31T20", "2020-03-31T24:00", "2020-03-31T20:60", "2020-03-31T20:00:60",
        "2020-03-31T20:00:00.", "2020-03-31T20:00:00.Z", "2020-03-31T20:00Zx", "2020-03-31T20:00+2",
        "2020-03-31T20:00+02", "2020-03-31T20:00+24:00", "2020-03-31Z", "2020-03-31T20:00:00,5",
        "+2020-03-31", "2020-03-31T-1:00", " 2020-03-31", "2020-03-31 ",
        "2020-03-31T20:00:00.0000000001"};
    // clang-format on
    for (const char* text : texts) EXPECT_EQ(inUTC(text), "none") << text;
}

TEST(VSISO8601, WritesWhatReadsBack) {
    std::mt19937_64 random(5);
    for (const char* zone :
         {"Europe/Copenhagen", "Asia/Kathmandu", "Africa/Monrovia", "America/St_Johns", "Pacific/Apia"}) {
        const VSCalendar calendar(zone, "en_US");
        std::uniform_int_distribution<int64_t> between(-4'000'000'000'000'000,
                                                       8'000'000'000'000'000);  // 1843 to 2223
        for (int i = 0; i < 2000; ++i) {
            const VSDate date = VSDate::fromMicroseconds(between(random));
            const std::string text = VSISO8601FromDate(date, calendar);
            ASSERT_EQ(VSDateFromISO8601(text, kUTC), date) << text;
        }
    }
    EXPECT_EQ(VSISO8601FromDate(VSDate::fromMicroseconds(-1), kUTC), "1969-12-31T23:59:59.999999+00:00");
    // Liberia was 44 minutes and 30 seconds behind Greenwich.
    const VSCalendar monrovia("Africa/Monrovia", "en_LR");
    EXPECT_EQ(VSISO8601FromDate(VSDate::fromSeconds(0), monrovia), "1969-12-31T23:16:00-00:44");
}

}  // namespace
