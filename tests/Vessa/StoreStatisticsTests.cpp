#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <map>
#include <random>

#include "StoreTestSupport.h"

using namespace test;

namespace {

// The definition, as simply as it can be written. Times are whole seconds here.
struct Plain {
    int64_t start, end;  // seconds since 1970
    double value;
    int rank;  // of its source in the order of sources
};

struct Expected {
    int64_t count = 0;
    double startingSum = 0, minimum = INFINITY, maximum = -INFINITY;
    bool touched = false;
    double sum = 0;
};

bool covers(const Plain& earlier, double moment) {
    return earlier.start <= moment && moment < earlier.end;
}

/// How much of a sample's value counts in [from, to): its span is cut at every border of other samples, and
/// each piece counts unless a sample of an earlier source covers its middle.
double countedShare(const Plain& sample, const std::vector<Plain>& all, int64_t from, int64_t to,
                    bool merged) {
    const auto isCovered = [&](double moment) {
        return merged && std::any_of(all.begin(), all.end(), [&](const Plain& other) {
                   return other.rank < sample.rank && covers(other, moment);
               });
    };
    if (sample.start == sample.end) return isCovered(static_cast<double>(sample.start)) ? 0 : sample.value;
    const int64_t a = std::max(sample.start, from), b = std::min(sample.end, to);
    std::vector<int64_t> cuts{a, b};
    for (const Plain& other : all) {
        for (int64_t cut : {other.start, other.end}) {
            if (a < cut && cut < b) cuts.push_back(cut);
        }
    }
    std::sort(cuts.begin(), cuts.end());
    int64_t seconds = 0;
    for (size_t i = 0; i + 1 < cuts.size(); ++i) {
        if (!isCovered(static_cast<double>(cuts[i] + cuts[i + 1]) / 2)) seconds += cuts[i + 1] - cuts[i];
    }
    return sample.value * static_cast<double>(seconds) / static_cast<double>(sample.end - sample.start);
}

Expected expectedIn(const std::vector<Plain>& all, int64_t from, int64_t to, bool merged, int onlyRank = -1) {
    Expected expected;
    for (const Plain& sample : all) {
        if (onlyRank >= 0 && sample.rank != onlyRank) continue;
        const bool startsIn = sample.start >= from && sample.start < to;
        if (startsIn) {
            ++expected.count;
            expected.startingSum += sample.value;
            expected.minimum = std::min(expected.minimum, sample.value);
            expected.maximum = std::max(expected.maximum, sample.value);
        }
        if (startsIn || (sample.start < to && sample.end > from)) {
            expected.touched = true;
            expected.sum += countedShare(sample, all, from, to, merged);
        }
    }
    return expected;
}

constexpr int allOptions = VSStatisticsOptionDiscreteAverage | VSStatisticsOptionDiscreteMin |
                           VSStatisticsOptionDiscreteMax | VSStatisticsOptionCumulativeSum;

template <typename Actual>
void expectSame(const Actual& actual, const Expected& expected, const std::string& where) {
    EXPECT_EQ(actual.count, expected.count) << where;
    ASSERT_EQ(actual.sum.has_value(), expected.touched) << where;
    if (expected.touched) {
        EXPECT_NEAR(*actual.sum, expected.sum, 1e-7 * std::max(1.0, std::abs(expected.sum))) << where;
    }
    ASSERT_EQ(actual.average.has_value(), expected.count > 0) << where;
    if (!expected.count) return;
    EXPECT_NEAR(*actual.average, expected.startingSum / static_cast<double>(expected.count),
                1e-9 * std::max(1.0, std::abs(*actual.average)))
        << where;
    EXPECT_EQ(actual.minimum, expected.minimum) << where;
    EXPECT_EQ(actual.maximum, expected.maximum) << where;
}

/// A store with a random history, and the same history in plain form.
class History {
 public:
    History(unsigned seed, const VSObjectType* type, const std::string& zone)
        : random_(seed),
          type_(type),
          environment_("2020-03-31T20:00", zone),
          store_(openStore(folder_.path())) {
        const char* origins[] = {"2020-03-27T00:00", "2020-10-23T00:00", "1985-12-30T00:00"};
        origin_ = date(origins[pick(0, 2)]);
        const char* names[] = {"Watch", "Phone", "Band"};
        for (int i = static_cast<int>(pick(1, 4)); i > 0; --i)
            provenances_.push_back(i == 4 ? VSProvenance() : from(names[i - 1]));
        if (pick(0, 2) == 0)
            provenances_.push_back(from("Watch", "2"));  // the same source in a later version
    }

    int64_t pick(int64_t low, int64_t high) {
        return std::uniform_int_distribution<int64_t>(low, high)(random_);
    }
    VSHealthStore& store() { return *store_; }
    VSDate origin() const { return origin_; }

    void addSome(int count) {
        std::vector<VSSamplePtr> objects;
        for (int i = 0; i < count; ++i) {
            const VSDate start =
                origin_ + std::chrono::seconds(pick(0, 2) ? pick(0, 6 * 86400) : 900 * pick(0, 6 * 96));
            const int64_t lengths[] = {0,
                                       pick(1, 900),
                                       900 * pick(1, 8),
                                       pick(1, 20000),
                                       86400 * pick(0, 4) + pick(0, 90000),
                                       86400 * pick(0, 9) == 0 ? 86400 * 40 : 60};
            objects.push_back(quantity(
                type_, static_cast<double>(pick(0, 100)), start,
                start + std::chrono::seconds(lengths[pick(0, 5)]),
                provenances_[static_cast<size_t>(pick(0, static_cast<int64_t>(provenances_.size()) - 1))]));
        }
        EXPECT_OK(store_->saveObjectsAndWait(std::move(objects)));
    }

    void removeSome(int count) {
        auto samples = allSamples(*store_, type_);
        std::shuffle(samples.begin(), samples.end(), random_);
        samples.resize(std::min(samples.size(), static_cast<size_t>(count)));
        EXPECT_OK(wait([&](auto done) { store_->deleteObjects(samples, done); }));
    }

    void reorder() {
        auto sources = order();
        std::shuffle(sources.begin(), sources.end(), random_);
        sources.resize(static_cast<size_t>(pick(0, static_cast<int64_t>(sources.size()))));
        EXPECT_OK(wait([&](auto done) { store_->setOrderedSources(sources, type_, done); }));
    }

    std::vector<VSSource> order() {
        Promise<std::vector<VSSource>> promise;
        store_->orderedSources(type_, [&](const auto& result) { promise.set(*result); });
        return *promise.wait();
    }

    /// One random question, compared with the definition.
    void compareOnce(const std::string& where) {
        const auto sources = order();
        std::vector<Plain> plain;
        for (const auto& sample : allSamples(*store_, type_)) {
            const auto place = std::find(sources.begin(), sources.end(), sample->sourceRevision().source);
            ASSERT_NE(place, sources.end());
            plain.push_back({sample->startDate().microseconds() / 1'000'000,
                             sample->endDate().microseconds() / 1'000'000,
                             dynamic_cast<const VSQuantitySample&>(*sample).quantity().value(),
                             static_cast<int>(place - sources.begin())});
        }
        const VSDateComponents intervals[] = {{0, 0, 1, 0, 0, 0}, {0, 0, 0, 1, 0, 0},  {0, 0, 7, 0, 0, 0},
                                              {0, 1, 0, 0, 0, 0}, {0, 0, 0, 0, 30, 0}, {0, 0, 0, 0, 7, 0}};
        const VSDateComponents interval = intervals[pick(0, 9) == 0 ? 5 : pick(0, 4)];
        const VSDate from =
            origin_ + std::chrono::seconds(pick(0, 3) ? 86400 * pick(-2, 5) : pick(-86400, 500000));
        const VSDate to = from + std::chrono::seconds(pick(0, 3) ? 86400 * pick(1, 8) : pick(1, 700000));
        const VSDate anchor = pick(0, 2) ? VSCalendar::current().startOfDay(from) : from;
        const auto predicate = VSPredicate::samplesWithStartDate(from, to, 0);
        const auto collection = store_->statisticsCollection(
            type_, predicate, allOptions | VSStatisticsOptionSeparateBySource, anchor, interval);
        ASSERT_TRUE(collection.ok()) << collection.error().message;
        std::map<VSDate, const VSStatistics*> found;
        for (const auto& bucket : (*collection)->statistics()) found[bucket.startDate] = &bucket;

        const auto borders = VSCalendar::current().bucketBoundaries(anchor, interval, from, to);
        size_t met = 0;
        for (size_t i = 0; i + 1 < borders.size(); ++i) {
            // Of a bucket at the end of the range, the part inside of it.
            const int64_t a = std::max(borders[i], from).microseconds() / 1'000'000,
                          b = std::min(borders[i + 1], to).microseconds() / 1'000'000;
            const Expected expected = expectedIn(plain, a, b, type_->isCumulative());
            const auto bucket = found.find(borders[i]);
            const std::string place = where + ", bucket " + std::to_string(i);
            ASSERT_EQ(bucket != found.end(), expected.count > 0 || expected.touched) << place;
            if (bucket == found.end()) continue;
            ++met;
            EXPECT_EQ(bucket->second->endDate, borders[i + 1]) << place;
            expectSame(*bucket->second, expected, place);
            for (size_t rank = 0; rank < sources.size(); ++rank) {
                const Expected own = expectedIn(plain, a, b, false, static_cast<int>(rank));
                const auto ofSource = bucket->second->bySource.find(sources[rank]);
                ASSERT_EQ(ofSource != bucket->second->bySource.end(), own.touched) << place;
                if (own.touched) expectSame(ofSource->second, own, place + ", source " + sources[rank].name);
            }
        }
        EXPECT_EQ(met, found.size()) << where;
        const auto single = store_->statistics(type_, predicate, allOptions);
        expectSame(*single,
                   expectedIn(plain, from.microseconds() / 1'000'000, to.microseconds() / 1'000'000,
                              type_->isCumulative()),
                   where + ", whole range");
    }

 private:
    std::mt19937 random_;
    const VSObjectType* const type_;
    FixedEnvironment environment_;
    TemporaryFolder folder_;
    VSDate origin_;
    std::vector<VSProvenance> provenances_;
    std::shared_ptr<VSHealthStore> store_;
};

}  // namespace

/// Random histories, with deletions, new orders of the sources and additions between the questions, in zones
/// with summer time and with odd offsets.
TEST(StoreStatistics, AgreeWithTheDefinition) {
    const char* zones[] = {"Europe/Copenhagen", "America/New_York", "Asia/Kathmandu"};
    for (unsigned seed = 0; seed < 36 && !testing::Test::HasFailure(); ++seed) {
        History history(seed, seed % 3 ? steps() : heartRate(), zones[seed / 3 % 3]);
        for (int step = 0; step < 4 && !testing::Test::HasFailure(); ++step) {
            history.addSome(static_cast<int>(history.pick(1, 60)));
            if (step) history.removeSome(static_cast<int>(history.pick(0, 25)));
            if (history.pick(0, 2) == 0) history.reorder();
            for (int question = 0; question < 6; ++question) {
                history.compareOnce("seed " + std::to_string(seed) + ", step " + std::to_string(step) +
                                    ", question " + std::to_string(question));
            }
            expectSound(history.store());  // the rollups kept equal rollups made anew, bit for bit
        }
    }
}

TEST(StoreStatistics, TwoSourcesOfTheSameStepsCountOnce) {
    FixedEnvironment environment;
    TemporaryFolder folder;
    const auto store = openStore(folder.path());
    EXPECT_OK(store->saveObjectsAndWait({
        quantity(steps(), 1000, "2020-03-01T10:00", "2020-03-01T11:00", from("Phone")),
        quantity(steps(), 1200, "2020-03-01T10:30", "2020-03-01T11:30", from("Watch")),
        quantity(steps(), 7, "2020-03-01T10:59:59", "2020-03-01T10:59:59",
                 from("Watch")),  // its moment is the phone's
        quantity(steps(), 5, "2020-03-01T11:00", "2020-03-01T11:00",
                 from("Watch")),  // the phone's span ends before it
    }));
    const auto statistics =
        store->statistics(steps(), {}, VSStatisticsOptionCumulativeSum | VSStatisticsOptionSeparateBySource);
    EXPECT_EQ(statistics->sum, 1000 + 600 + 5);
    EXPECT_EQ(statistics->bySource.at(VSSource::forImportedName("Watch")).sum, 1212);
    EXPECT_OK(wait(
        [&](auto done) { store->setOrderedSources({VSSource::forImportedName("Watch")}, steps(), done); }));
    EXPECT_EQ(store->statistics(steps(), {}, VSStatisticsOptionCumulativeSum)->sum, 1212 + 500);
}

/// Local days of a zone whose offset was not whole quarters then.
TEST(StoreStatistics, BordersInsideOfAQuarterAreExact) {
    FixedEnvironment environment("1930-06-03T12:00", "Africa/Monrovia");  // 44 minutes 30 seconds behind
    TemporaryFolder folder;
    const auto store = openStore(folder.path());
    const VSDate midnight = date("1930-06-02");
    ASSERT_NE(midnight.microseconds() % (900 * 1'000'000), 0);
    const auto second = std::chrono::seconds(1);
    EXPECT_OK(store->saveObjectsAndWait({quantity(heartRate(), 50, midnight - second, midnight - second),
                                         quantity(heartRate(), 70, midnight, midnight),
                                         quantity(heartRate(), 90, midnight + second, midnight + second)}));
    const auto days = store->statisticsCollection(heartRate(), {}, VSStatisticsOptionDiscreteAverage,
                                                  midnight, {0, 0, 1, 0, 0, 0});
    ASSERT_EQ((*days)->statistics().size(), 2u);
    EXPECT_EQ((*days)->statistics()[0].average, 50);
    EXPECT_EQ((*days)->statistics()[1].average, 80);
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
