#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <map>

#include "StatisticsHistory.h"

using namespace test;

namespace {

int64_t secondsOf(VSDate date) {
    return date.microseconds() / 1'000'000;
}

/// The sample to which a moment belongs: of those that cover it the one of the earliest source, of these the
/// one that starts first, of these the one of the lowest number.
const PlainSample* ownerOf(int64_t moment, const std::vector<PlainSample>& all) {
    const PlainSample* owner = nullptr;
    for (const PlainSample& sample : all) {
        const auto claim = [](const PlainSample& one) {
            return std::tuple(one.rank, one.start, VSObjectIDValue(one.id));
        };
        if (sample.covers(moment) && (!owner || claim(sample) < claim(*owner))) owner = &sample;
    }
    return owner;
}

class Explained {
 public:
    Explained(History& history, std::string where)
        : history_(history), where_(std::move(where)), plain_(history.plain(history.order())) {
        for (const PlainSample& sample : plain_) byNumber_[VSObjectIDValue(sample.id)] = &sample;
    }

    void compare() {
        const auto [from, to] = history_.pickRange();
        from_ = secondsOf(from), to_ = secondsOf(to);
        const auto predicate = VSPredicate::samplesWithStartDate(from, to, 0);
        const auto explanation =
            history_.store().explainStatistics(history_.type(), predicate, allStatistics);
        ASSERT_TRUE(explanation.ok()) << explanation.error().message;
        long double counted = 0;
        int64_t starting = 0;
        for (const auto& contribution : explanation->contributions) {
            counted += contribution.counted;
            starting += contribution.startsInRange;
            compareOne(contribution);
        }
        const auto inRange = [&](const PlainSample& sample) { return liesIn(sample, from_, to_); };
        EXPECT_EQ(explanation->contributions.size(), std::count_if(plain_.begin(), plain_.end(), inRange))
            << where_;
        EXPECT_EQ(starting, explanation->statistics.count) << where_;
        if (explanation->statistics.sum) expectExactly(*explanation->statistics.sum, counted, where_);
    }

 private:
    void compareOne(const VSStatisticsExplanation::Contribution& contribution) {
        const PlainSample& sample = *byNumber_.at(VSObjectIDValue(contribution.sample->dataID()));
        const bool merged = history_.type()->isCumulative();
        expectExactly(contribution.inRange, countedShare(sample, plain_, from_, to_, false), where_);
        expectExactly(contribution.counted, countedShare(sample, plain_, from_, to_, merged), where_);
        long double sum = contribution.counted;
        int64_t reached = std::max(sample.start, from_);
        for (const auto& taken : contribution.taken) {
            const int64_t from = secondsOf(taken.from), to = secondsOf(taken.to);
            EXPECT_GE(from, reached) << where_;
            EXPECT_LE(to, std::min(sample.end, to_)) << where_;
            EXPECT_TRUE(from < to || sample.start == sample.end) << where_;
            sum += taken.amount;
            reached = to;
            const PlainSample& by = *byNumber_.at(VSObjectIDValue(taken.by->dataID()));
            EXPECT_LT(by.rank, sample.rank) << where_;
            // Who owns a moment changes at borders only.
            EXPECT_EQ(ownerOf(from, plain_), &by) << where_;
            for (const PlainSample& other : plain_) {
                for (int64_t border : {other.start, other.end}) {
                    if (from < border && border < to) {
                        EXPECT_EQ(ownerOf(border, plain_), &by) << where_;
                    }
                }
            }
        }
        EXPECT_NEAR(static_cast<double>(sum), contribution.inRange, 1e-15 * std::fabs(contribution.inRange))
            << where_;
    }

    History& history_;
    const std::string where_;
    const std::vector<PlainSample> plain_;
    std::map<int64_t, const PlainSample*> byNumber_;
    int64_t from_ = 0, to_ = 0;  // seconds
};

}  // namespace

TEST(StoreExplanation, OfRandomHistoriesAddsUp) {
    for (unsigned seed = 1000; seed < 1000 + historyCount(60) && !testing::Test::HasFailure(); ++seed) {
        History history(seed);
        for (int step = 0; step < 5 && !testing::Test::HasFailure(); ++step) {
            history.change();
            const std::string where = "seed " + std::to_string(seed) + ", step " + std::to_string(step);
            for (int question = 0; question < 3; ++question) Explained(history, where).compare();
        }
    }
}

/// The watch takes the phone's second half hour; of its own moment in the phone's span nothing counts.
TEST(StoreExplanation, NamesTheSampleThatHasTheRest) {
    FixedEnvironment environment;
    TemporaryFolder folder;
    const auto store = openStore(folder.path());
    EXPECT_OK(store->saveObjectsAndWait(
        {quantity(steps(), 900, "2020-03-01T10:00", "2020-03-01T11:30", from("Phone")),
         quantity(steps(), 500, "2020-03-01T10:30", "2020-03-01T10:45", from("Watch")),
         quantity(steps(), 100, "2020-03-01T10:45", "2020-03-01T11:00", from("Watch")),
         quantity(steps(), 7, "2020-03-01T10:40", "2020-03-01T10:40")}));
    EXPECT_OK(wait([&](auto done) {
        store->setOrderedSources({VSSource::forImportedName("Watch"), VSSource::forImportedName("Phone")},
                                 steps(), done);
    }));
    const auto explanation = store->explainStatistics(
        steps(), VSPredicate::samplesWithStartDate(date("2020-03-01T10:30"), date("2020-03-01T12:00"), 0),
        VSStatisticsOptionCumulativeSum);
    ASSERT_TRUE(explanation.ok());
    EXPECT_EQ(explanation->statistics.sum, 600 + 300);
    EXPECT_EQ(explanation->statistics.bySource.at(VSSource::forImportedName("Phone")).sum, 600);
    const auto& all = explanation->contributions;
    ASSERT_EQ(all.size(), 4u);
    EXPECT_FALSE(all[0].startsInRange);
    EXPECT_EQ(all[0].inRange, 600);
    EXPECT_EQ(all[0].counted, 300);
    ASSERT_EQ(all[0].taken.size(), 2u);
    EXPECT_EQ(all[0].taken[0].by, all[1].sample);
    EXPECT_EQ(all[0].taken[0].to, date("2020-03-01T10:45"));
    EXPECT_EQ(all[0].taken[1].amount, 150);
    EXPECT_EQ(all[2].counted, 0);  // the moment, by hand
    EXPECT_EQ(all[2].taken.at(0).by, all[1].sample);
    EXPECT_EQ(all[2].taken.at(0).from, all[2].taken.at(0).to);
    EXPECT_EQ(all[3].counted, 100);
}
