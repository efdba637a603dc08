#include <gtest/gtest.h>

#include <algorithm>
#include <map>

#include "StatisticsHistory.h"

using namespace test;

namespace {

template <typename Actual>
void expectSame(const Actual& actual, const PlainStatistics& expected, const std::string& where) {
    EXPECT_EQ(actual.count, expected.count) << where;
    ASSERT_EQ(actual.sum.has_value(), expected.touched) << where;
    if (expected.touched) expectExactly(*actual.sum, expected.sum, where);
    ASSERT_EQ(actual.average.has_value(), expected.count > 0) << where;
    if (!expected.count) return;
    expectExactly(*actual.average, expected.startingSum / static_cast<long double>(expected.count), where);
    EXPECT_EQ(actual.minimum, expected.minimum) << where;
    EXPECT_EQ(actual.maximum, expected.maximum) << where;
}

/// One random question, compared with the definition.
void compareOnce(History& history, const std::string& where) {
    const auto sources = history.order();
    const auto plain = history.plain(sources);
    const bool merged = history.type()->isCumulative();
    const VSDateComponents interval = history.pickInterval();
    const auto [from, to] = history.pickRange();
    const VSDate anchor = history.pick(0, 2) ? VSCalendar::current().startOfDay(from) : from;
    const auto predicate = VSPredicate::samplesWithStartDate(from, to, 0);
    const auto collection = history.store().statisticsCollection(
        history.type(), predicate, allStatistics | VSStatisticsOptionSeparateBySource, anchor, interval);
    ASSERT_TRUE(collection.ok()) << collection.error().message;
    std::map<VSDate, const VSStatistics*> found;
    for (const auto& bucket : (*collection)->statistics()) found[bucket.startDate] = &bucket;

    const auto borders = VSCalendar::current().bucketBoundaries(anchor, interval, from, to);
    size_t met = 0;
    for (size_t i = 0; i + 1 < borders.size(); ++i) {
        // Of a bucket at the end of the range, the part inside of it.
        const int64_t a = std::max(borders[i], from).microseconds() / 1'000'000,
                      b = std::min(borders[i + 1], to).microseconds() / 1'000'000;
        const PlainStatistics expected = plainStatistics(plain, a, b, merged);
        const auto bucket = found.find(borders[i]);
        const std::string place = where + ", bucket " + std::to_string(i);
        ASSERT_EQ(bucket != found.end(), expected.touched) << place;
        if (bucket == found.end()) continue;
        ++met;
        EXPECT_EQ(bucket->second->endDate, borders[i + 1]) << place;
        expectSame(*bucket->second, expected, place);
        for (size_t rank = 0; rank < sources.size(); ++rank) {
            const PlainStatistics own = plainStatistics(plain, a, b, false, static_cast<int>(rank));
            const auto ofSource = bucket->second->bySource.find(sources[rank]);
            ASSERT_EQ(ofSource != bucket->second->bySource.end(), own.touched) << place;
            if (own.touched) expectSame(ofSource->second, own, place + ", source " + sources[rank].name);
        }
    }
    EXPECT_EQ(met, found.size()) << where;
    const auto single = history.store().statistics(history.type(), predicate, allStatistics);
    expectSame(*single,
               plainStatistics(plain, from.microseconds() / 1'000'000, to.microseconds() / 1'000'000, merged),
               where + ", whole range");
}

}  // namespace

/// Random histories with changes between the questions, in zones with summer time and with odd offsets.
TEST(StoreStatistics, AgreeWithTheDefinition) {
    for (unsigned seed = 0; seed < historyCount(120) && !testing::Test::HasFailure(); ++seed) {
        History history(seed);
        for (int step = 0; step < 7 && !testing::Test::HasFailure(); ++step) {
            history.change();
            for (int question = 0; question < 4; ++question) {
                compareOnce(history, "seed " + std::to_string(seed) + ", step " + std::to_string(step) +
                                         " (" + history.lastChange() + "), question " +
                                         std::to_string(question));
            }
            expectSound(history.store());  // the rollups kept equal rollups made anew, bit for bit
        }
    }
}

TEST(StoreStatistics, ConditionsSelectTheSamplesThatExist) {
    FixedEnvironment environment;
    TemporaryFolder folder;
    const auto store = openStore(folder.path());
    EXPECT_OK(store->saveObjectsAndWait(
        {quantity(steps(), 100, "2020-03-01T10:00", "2020-03-01T11:00", from("Phone")),
         quantity(steps(), 100, "2020-03-01T10:00", "2020-03-01T12:00", from("Watch"))}));
    VSPredicate ofWatch;
    ofWatch.sources = {VSSource::forImportedName("Watch")};
    EXPECT_EQ(store->statistics(steps(), ofWatch, VSStatisticsOptionCumulativeSum)->sum, 100);
    EXPECT_EQ(store->statistics(steps(), {}, VSStatisticsOptionCumulativeSum)->sum, 150);
    const auto strict = VSPredicate::samplesWithStartDate(date("2020-03-01T10:00"), date("2020-03-01T11:30"),
                                                          VSQueryOptionStrictEndDate);
    EXPECT_EQ(store->statistics(steps(), strict, VSStatisticsOptionCumulativeSum)->sum, 100)
        << "the watch's span ends too late";
}
