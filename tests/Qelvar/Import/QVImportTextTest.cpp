#include "Qelvar/Import/QVImportText.h"

#include <gtest/gtest.h>

#include "TestSupport.h"

TEST(QVImportText, DatesAreReadToTheSecondAndWithTheirOffset) {
    const auto date = QVImportDateFromText("2015-03-20 17:15:42 -0730");
    ASSERT_TRUE(date);
    EXPECT_EQ(date->date, test::date("2015-03-21T00:45:42Z"));
    EXPECT_EQ(date->offset, -(7 * 3600 + 30 * 60));
    EXPECT_EQ(QVImportDateFromText("2016-02-29 23:59:59 +1400")->date, test::date("2016-02-29T09:59:59Z"));
    EXPECT_EQ(QVImportDateFromText("1969-12-31 23:59:59 +0000")->date, VSDate::fromSeconds(-1));
}

TEST(QVImportText, WhatIsNoDateIsNone) {
    // clang-format off
    const char* const texts[] = {
        "", "2015-03-20", "2015-03-20 17:15:00", "2015-03-20 17:15:00 0700",
        "2015-03-20 17:15:00 +07:00", "2015-03-20 17:15:00 +0760", "2015-03-20 17:15:00 +1900",
        "2015-02-29 17:15:00 +0000", "2015-13-01 17:15:00 +0000", "2015-00-01 17:15:00 +0000",
        "2015-01-00 17:15:00 +0000", "2015-03-20 24:00:00 +0000", "2015-03-20 17:60:00 +0000",
        "2015-03-20 17:15:60 +0000", "-001-03-20 17:15:00 +0000", " 2015-03-20 17:15:00 +0000",
        "2015-03-20 17:15:00 +0000 ", "20150-3-20 17:15:00 +0000", "2015-03-2O 17:15:00 +0000",
        "-015-03-20 17:15:00 +0000", "\xFF\xFE\xFF\xFE 17:15:00 +0000 and more"};
    // clang-format on
    for (const char* text : texts) {
        EXPECT_FALSE(QVImportDateFromText(text)) << text;
    }
}

TEST(QVImportText, BirthDatesAreDays) {
    EXPECT_EQ(QVImportBirthDateFromText("1985-07-21"), (VSBirthDate{1985, 7, 21}));
    EXPECT_EQ(QVImportBirthDateFromText("١٩٨٥-٠٧-٢١"), (VSBirthDate{1985, 7, 21}));
    for (const char* text : {"", "1985-7-21", "1985-02-30", "21.07.1985", "1985-07-21 00:00:00 +0000"})
        EXPECT_FALSE(QVImportBirthDateFromText(text)) << text;
}

TEST(QVImportText, NumbersAreFiniteAndTakeTheWholeText) {
    EXPECT_EQ(QVImportNumberFromText("72"), 72.0);
    EXPECT_EQ(QVImportNumberFromText("-0.5"), -0.5);
    EXPECT_EQ(QVImportNumberFromText("1.23457e+06"), 1234570.0);
    EXPECT_EQ(QVImportNumberFromText("5.033333333333333"), 5.033333333333333);
    for (const char* text : {"", " 72", "72 ", "7,5", "1.234,5", "nan", "NaN", "inf", "-Infinity", "0x1p3",
                             "1e999", "+72", "72bpm", "--1", "."}) {
        EXPECT_FALSE(QVImportNumberFromText(text)) << text;
    }
}

TEST(QVImportText, QuotedTextsAreCutBetweenCharactersAndStayOnOneLine) {
    EXPECT_EQ(QVImportQuoted("a\nb\tc"), "\"a b c\"");
    EXPECT_EQ(QVImportQuoted("aøb", 2), "\"a...\"");
    EXPECT_EQ(QVImportQuoted("aøb", 3), "\"aø...\"");
    EXPECT_EQ(QVImportQuoted("aøb", 4), "\"aøb\"");
}
