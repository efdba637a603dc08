#include "Vessa/VSPredicate.h"

#include <gtest/gtest.h>

#include <random>

#include "Vessa/VSStatistics.h"

namespace {

VSDate at(int seconds) {
    return VSDate::fromSeconds(seconds);
}

VSCategorySample sleep(int start, int end, int value = 1, VSProvenance provenance = {}) {
    return VSCategorySample(VSObjectType::dataTypeWithCode(VSCode::SleepAnalysis), value, at(start), at(end),
                            std::move(provenance));
}

TEST(VSPredicate, RangesMeetSpans) {
    struct Case {
        int start, end;
        bool none, strictStart, strictEnd;
    };
    // Against [10, 20).
    const Case cases[] = {
        {0, 5, false, false, false},   {0, 10, false, false, false}, {5, 11, true, false, true},
        {10, 10, true, true, true},    {10, 20, true, true, true},   {5, 25, true, false, false},
        {15, 25, true, true, false},   {19, 19, true, true, true},   {20, 20, false, false, false},
        {20, 30, false, false, false}, {9, 9, false, false, false},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(std::to_string(c.start) + " to " + std::to_string(c.end));
        const auto matches = [&](int options) {
            return VSPredicate::samplesWithStartDate(at(10), at(20), options).matches(sleep(c.start, c.end));
        };
        EXPECT_EQ(matches(VSQueryOptionNone), c.none);
        EXPECT_EQ(matches(VSQueryOptionStrictStartDate), c.strictStart);
        EXPECT_EQ(matches(VSQueryOptionStrictEndDate), c.strictEnd);
        EXPECT_EQ(matches(VSQueryOptionStrictStartDate | VSQueryOptionStrictEndDate),
                  c.strictStart && c.strictEnd);
    }
    EXPECT_TRUE(VSPredicate::samplesWithStartDate(at(10), std::nullopt, 0).matches(sleep(100, 200)));
    EXPECT_TRUE(VSPredicate::samplesWithStartDate(std::nullopt, at(10), 0).matches(sleep(0, 200)));
    EXPECT_FALSE(VSPredicate::samplesStartingBefore(at(10)).matches(sleep(10, 10)));
    EXPECT_TRUE(VSPredicate::samplesStartingBefore(at(10)).matches(sleep(9, 50)));
}

TEST(VSPredicate, ConditionsOnOriginAndNotes) {
    VSProvenance provenance;
    provenance.sourceRevision =
        std::make_shared<VSSourceRevision>(VSSourceRevision{{"Scale", "import.Scale"}, "2"});
    provenance.device = std::make_shared<VSDevice>(VSDevice::fromDescription("name:S"));
    provenance.metadata = std::make_shared<VSMetadata>(VSMetadata{{"note", "x"}});
    const auto sample = sleep(0, 1, 1, provenance), plain = sleep(0, 1, 0);

    VSPredicate ofScale, ofApplication, ofDevice, noted;
    ofScale.sources = {{"Scale", "import.Scale"}, {"Other", "import.Other"}};
    ofApplication.sources = {VSSource::application()};
    ofDevice.device = *provenance.device;
    noted.metadataKeys = {"note"};
    const std::pair<VSPredicate, std::pair<bool, bool>> cases[] = {
        {{}, {true, true}},
        {ofScale, {true, false}},
        {ofApplication, {false, true}},
        {ofDevice, {true, false}},
        {noted, {true, false}},
        {VSPredicate::withMetadata("note", "x"), {true, false}},
        {VSPredicate::withMetadata("note", "y"), {false, false}},
        {VSPredicate::withCategoryValue(0), {false, true}},
        {ofScale & noted & VSPredicate::withCategoryValue(1), {true, false}},
        {ofScale & ofApplication, {false, false}},
        {VSPredicate::withCategoryValue(0) & VSPredicate::withCategoryValue(1), {false, false}},
    };
    int number = 0;
    for (const auto& [predicate, expected] : cases) {
        EXPECT_EQ(predicate.matches(sample), expected.first) << number;
        EXPECT_EQ(predicate.matches(plain), expected.second) << number;
        ++number;
    }
}

TEST(VSPredicate, OnlyAPlainRangeIsOne) {
    EXPECT_TRUE(VSPredicate().isDateRangeOnly());
    EXPECT_TRUE(VSPredicate::samplesWithStartDate(at(0), at(1), 0).isDateRangeOnly());
    EXPECT_FALSE(
        VSPredicate::samplesWithStartDate(at(0), at(1), VSQueryOptionStrictStartDate).isDateRangeOnly());
    EXPECT_FALSE(VSPredicate::samplesStartingBefore(at(0)).isDateRangeOnly());
    EXPECT_FALSE(VSPredicate::withCategoryValue(0).isDateRangeOnly());
    EXPECT_FALSE(VSPredicate::withMetadata("a", 1).isDateRangeOnly());
    VSPredicate predicate;
    predicate.noCorrelation = true;
    EXPECT_FALSE(predicate.isDateRangeOnly());
}

TEST(VSPredicate, JoiningMeansBoth) {
    std::mt19937 random(8);
    const auto moment = [&random]() -> std::optional<VSDate> {
        if (random() % 4 == 0) return std::nullopt;
        return at(static_cast<int>(random() % 10));
    };
    int matched = 0;
    for (int i = 0; i < 20'000; ++i) {
        const auto range = [&] {
            return VSPredicate::samplesWithStartDate(moment(), moment(), static_cast<int>(random() % 4));
        };
        auto a = range(), b = range();
        a.startsBefore = moment();
        b.startsBefore = moment();
        if (random() % 3 == 0) a.categoryValue = static_cast<int>(random() % 2);
        if (random() % 3 == 0) b.categoryValue = static_cast<int>(random() % 2);
        const auto c = range();
        const auto joined = a & b & c;
        const int start = static_cast<int>(random() % 10);
        const auto sample =
            sleep(start, start + static_cast<int>(random() % 5), static_cast<int>(random() % 2));
        ASSERT_EQ(joined.matches(sample), a.matches(sample) && b.matches(sample) && c.matches(sample));
        matched += joined.matches(sample);
    }
    EXPECT_GT(matched, 150);
}

TEST(VSStatisticsCollection, EnumeratesEmptyBucketsToo) {
    const auto* type = VSObjectType::dataTypeWithCode(VSCode::StepCount);
    const VSCalendar calendar("Europe/Copenhagen", "da_DK");
    const VSDate anchor = *calendar.date(2020, 1, 1);
    std::vector<VSStatistics> filled;
    for (const int day : {28, 29}) {
        VSStatistics statistics;
        statistics.type = type;
        statistics.startDate = *calendar.date(2020, 3, day);
        statistics.endDate = calendar.addDays(statistics.startDate, 1);
        statistics.sum = day;
        filled.push_back(statistics);
    }
    const VSStatisticsCollection collection(type, anchor, {.days = 1}, calendar, filled);
    std::vector<std::pair<VSDate, std::optional<double>>> seen;
    const auto look = [&](VSDate from, VSDate to) {
        seen.clear();
        collection.enumerateStatistics(from, to, [&](const VSStatistics& s) {
            EXPECT_EQ(s.endDate, calendar.addDays(s.startDate, 1));
            EXPECT_EQ(s.sumQuantity().has_value(), s.hasData());
            seen.emplace_back(s.startDate, s.sum);
        });
    };
    look(*calendar.date(2020, 3, 27, 12), *calendar.date(2020, 3, 30, 12));
    const std::vector<std::pair<VSDate, std::optional<double>>> expected{{*calendar.date(2020, 3, 27), {}},
                                                                         {*calendar.date(2020, 3, 28), 28},
                                                                         {*calendar.date(2020, 3, 29), 29},
                                                                         {*calendar.date(2020, 3, 30), {}}};
    EXPECT_EQ(seen, expected);
    look(*calendar.date(2020, 3, 29), *calendar.date(2020, 3, 30));
    EXPECT_EQ(seen, (std::vector{expected[2]}));
    look(*calendar.date(2020, 3, 29), *calendar.date(2020, 3, 29));
    EXPECT_TRUE(seen.empty());
}

}  // namespace
