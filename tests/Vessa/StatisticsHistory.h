#pragma once

#include <random>
#include <string>
#include <vector>

#include "StoreTestSupport.h"

namespace test {

inline constexpr int allStatistics = VSStatisticsOptionDiscreteAverage | VSStatisticsOptionDiscreteMin |
                                     VSStatisticsOptionDiscreteMax | VSStatisticsOptionCumulativeSum;

// The definition of the statistics, as simply as it can be written. Times are whole seconds here.
struct PlainSample {
    int64_t start, end;  // seconds since 1970
    double value;
    int rank;  // of its source in the order of sources
    VSObjectID id;
    bool covers(long double moment) const { return start <= moment && moment < end; }
};

struct PlainStatistics {
    int64_t count = 0;
    long double startingSum = 0, sum = 0;
    double minimum = 0, maximum = 0;
    bool touched = false;  // there is a sum
};

/// Whether a sample has anything in [from, to).
bool liesIn(const PlainSample& sample, int64_t from, int64_t to);
/// How much of a sample's value counts in [from, to): its span is cut at every border of other samples, and
/// each piece counts unless (when merged) a sample of an earlier source covers its middle.
long double countedShare(const PlainSample& sample, const std::vector<PlainSample>& all, int64_t from,
                         int64_t to, bool merged);
/// Over all sources, or one.
PlainStatistics plainStatistics(const std::vector<PlainSample>& all, int64_t from, int64_t to, bool merged,
                                int onlyRank = -1);

/// Equal where the value is whole, else within the last digits.
void expectExactly(double actual, long double expected, const std::string& where);

/// Seeds of random histories: so many, or as many as the environment variable VESSA_HISTORIES says.
unsigned historyCount(unsigned usually);

/// A store with a random history that grows by random changes, from two connections.
class History {
 public:
    explicit History(unsigned seed);

    /// One random change: samples come or go, one by one or many, sources get another order or vanish.
    void change();
    int64_t pick(int64_t low, int64_t high) {
        return std::uniform_int_distribution<int64_t>(low, high)(random_);
    }
    struct Range {
        VSDate from, to;
    };
    Range pickRange();
    VSDateComponents pickInterval();

    VSHealthStore& store() { return *stores_[static_cast<size_t>(pick(0, 1))]; }
    const VSObjectType* type() const { return type_; }
    const std::filesystem::path& folder() const { return folder_.path(); }
    std::vector<VSSource> order();
    /// What the store has now.
    std::vector<PlainSample> plain(const std::vector<VSSource>& order);
    const std::string& lastChange() const { return lastChange_; }

 private:
    VSSamplePtr sample(VSDate start);
    VSDate pickStart();
    void add(int count);
    void importSome(int count);
    void removeSome(int count);
    void removeSource();
    void reorder();

    std::mt19937 random_;
    const VSObjectType* type_;
    std::unique_ptr<FixedEnvironment> environment_;
    TemporaryFolder folder_;
    VSDate origin_;
    bool wholeValues_ = true;
    std::vector<VSProvenance> provenances_;
    std::vector<std::shared_ptr<VSHealthStore>> stores_;  // two connections to one store
    std::string lastChange_;
};

}  // namespace test
