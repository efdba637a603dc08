#include "StatisticsHistory.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <functional>

namespace test {

bool liesIn(const PlainSample& sample, int64_t from, int64_t to) {
    if (sample.start == sample.end) return sample.start >= from && sample.start < to;
    return sample.start < to && sample.end > from;
}

long double countedShare(const PlainSample& sample, const std::vector<PlainSample>& all, int64_t from,
                         int64_t to, bool merged) {
    const auto isCovered = [&](long double moment) {
        return merged && std::any_of(all.begin(), all.end(), [&](const PlainSample& other) {
                   return other.rank < sample.rank && other.covers(moment);
               });
    };
    if (sample.start == sample.end) return isCovered(sample.start) ? 0 : sample.value;
    const int64_t a = std::max(sample.start, from), b = std::min(sample.end, to);
    std::vector<int64_t> cuts{a, b};
    for (const PlainSample& other : all) {
        for (int64_t cut : {other.start, other.end}) {
            if (a < cut && cut < b) cuts.push_back(cut);
        }
    }
    std::sort(cuts.begin(), cuts.end());
    int64_t seconds = 0;
    for (size_t i = 0; i + 1 < cuts.size(); ++i) {
        const long double middle = static_cast<long double>(cuts[i] + cuts[i + 1]) / 2;
        if (!isCovered(middle)) seconds += cuts[i + 1] - cuts[i];
    }
    return static_cast<long double>(sample.value) * static_cast<long double>(seconds) /
           static_cast<long double>(sample.end - sample.start);
}

PlainStatistics plainStatistics(const std::vector<PlainSample>& all, int64_t from, int64_t to, bool merged,
                                int onlyRank) {
    PlainStatistics result;
    for (const PlainSample& sample : all) {
        if ((onlyRank >= 0 && sample.rank != onlyRank) || !liesIn(sample, from, to)) continue;
        result.touched = true;
        result.sum += countedShare(sample, all, from, to, merged);
        if (sample.start < from) continue;
        result.minimum = result.count ? std::min(result.minimum, sample.value) : sample.value;
        result.maximum = result.count ? std::max(result.maximum, sample.value) : sample.value;
        result.startingSum += sample.value;
        ++result.count;
    }
    return result;
}

void expectExactly(double actual, long double expected, const std::string& where) {
    if (std::fabs(expected - std::round(expected)) < 1e-12L)
        EXPECT_EQ(actual, static_cast<double>(std::round(expected))) << where;
    else
        EXPECT_DOUBLE_EQ(actual, static_cast<double>(expected)) << where;
}

unsigned historyCount(unsigned usually) {
    const char* wanted = std::getenv("VESSA_HISTORIES");
    return wanted ? static_cast<unsigned>(std::strtoul(wanted, nullptr, 10)) : usually;
}

History::History(unsigned seed) : random_(seed) {
    // Days on which clocks change, midnights of years, a day that an island left out, an offset of 44:30.
    const struct {
        const char* zone;
        const char* origin;
    } places[] = {{"Europe/Copenhagen", "2020-03-27T00:00"},   {"Europe/Copenhagen", "2020-10-23T00:00"},
                  {"America/New_York", "2019-12-29T00:00"},    {"America/New_York", "2020-03-06T00:00"},
                  {"Australia/Lord_Howe", "2020-10-02T00:00"}, {"Asia/Kathmandu", "1985-12-30T00:00"},
                  {"Pacific/Apia", "2011-12-27T00:00"},        {"America/St_Johns", "1969-12-29T00:00"},
                  {"Africa/Monrovia", "1930-06-01T00:00"}};
    const auto& place = places[static_cast<size_t>(pick(0, std::size(places) - 1))];
    environment_ = std::make_unique<FixedEnvironment>("2021-03-31T20:00", place.zone);
    origin_ = date(place.origin);
    type_ = pick(0, 4) ? steps() : heartRate();
    wholeValues_ = pick(0, 3) > 0;
    const char* names[] = {"Watch", "Phone", "Band"};
    for (int64_t i = pick(1, 4); i > 0; --i)
        provenances_.push_back(i == 4 ? VSProvenance() : from(names[i - 1]));
    if (pick(0, 2) == 0) provenances_.push_back(from("Watch", "2"));  // the same source in a later version
    for (int i = 0; i < 2; ++i) stores_.push_back(openStore(folder_.path()));
}

VSDate History::pickStart() {
    return origin_ + std::chrono::seconds(pick(0, 2) ? pick(0, 6 * 86400) : 900 * pick(0, 6 * 96));
}

VSSamplePtr History::sample(VSDate start) {
    const int64_t lengths[] = {0,
                               pick(1, 900),
                               900 * pick(1, 8),
                               pick(1, 20000),
                               86400 * pick(0, 2) + pick(0, 90000),
                               pick(0, 9) ? 60 : 86400 * pick(3, 400)};
    const double value = static_cast<double>(pick(0, 1000)) / (wholeValues_ ? 1 : 1000);
    return quantity(
        type_, value, start, start + std::chrono::seconds(lengths[pick(0, 5)]),
        provenances_[static_cast<size_t>(pick(0, static_cast<int64_t>(provenances_.size()) - 1))]);
}

void History::change() {
    const auto some = [&](int64_t low, int64_t high) { return static_cast<int>(pick(low, high)); };
    const std::function<void()> many = [&] { add(some(2, 60)); }, order = [&] { reorder(); };
    const std::pair<const char*, std::function<void()>> changes[] = {
        {"many added", many},
        {"many added", many},
        {"many added", many},
        {"one added", [&] { add(1); }},
        {"imported", [&] { importSome(some(1, 30)); }},
        {"removed", [&] { removeSome(some(1, 25)); }},
        {"a source removed", [&] { removeSource(); }},
        // Whose first sample it becomes may count first from now on.
        {"an earlier one added",
         [&] {
             EXPECT_OK(store().saveObjectsAndWait({sample(origin_ - std::chrono::seconds(pick(1, 90000)))}));
         }},
        {"sources in another order", order},
        {"sources in another order", order}};
    const auto& [name, change] = changes[pick(0, std::size(changes) - 1)];
    lastChange_ = name;
    change();
}

void History::add(int count) {
    std::vector<VSSamplePtr> objects;
    for (int i = 0; i < count; ++i) objects.push_back(sample(pickStart()));
    EXPECT_OK(store().saveObjectsAndWait(std::move(objects)));
}

void History::importSome(int count) {
    auto import = store().beginImport("more");
    ASSERT_TRUE(import.ok()) << import.error().message;
    for (int i = 0; i < count; ++i) ASSERT_TRUE((*import)->add(*sample(pickStart())).ok());
    EXPECT_OK((*import)->commit());
}

void History::removeSome(int count) {
    auto samples = allSamples(store(), type_);
    std::shuffle(samples.begin(), samples.end(), random_);
    samples.resize(std::min(samples.size(), static_cast<size_t>(count)));
    EXPECT_OK(wait([&](auto done) { store().deleteObjects(samples, done); }));
}

void History::removeSource() {
    const auto sources = order();
    if (sources.empty()) return;
    const auto& source = sources[static_cast<size_t>(pick(0, static_cast<int64_t>(sources.size()) - 1))];
    EXPECT_OK(wait([&](auto done) { store().deleteAllSamples({type_}, source.bundleIdentifier, done); }));
}

void History::reorder() {
    auto sources = order();
    std::shuffle(sources.begin(), sources.end(), random_);
    sources.resize(static_cast<size_t>(pick(0, static_cast<int64_t>(sources.size()))));
    EXPECT_OK(wait([&](auto done) { store().setOrderedSources(sources, type_, done); }));
}

std::vector<VSSource> History::order() {
    return sourceOrderOf(store(), type_);
}

std::vector<PlainSample> History::plain(const std::vector<VSSource>& order) {
    std::vector<PlainSample> result;
    for (const auto& sample : allSamples(store(), type_)) {
        const auto place = std::find(order.begin(), order.end(), sample->sourceRevision().source);
        EXPECT_NE(place, order.end());
        result.push_back({sample->startDate().microseconds() / 1'000'000,
                          sample->endDate().microseconds() / 1'000'000,
                          dynamic_cast<const VSQuantitySample&>(*sample).quantity().value(),
                          static_cast<int>(place - order.begin()), sample->dataID()});
    }
    return result;
}

History::Range History::pickRange() {
    const VSDate from =
        origin_ + std::chrono::seconds(pick(0, 3) ? 86400 * pick(-2, 5) : pick(-86400, 500000));
    return {from, from + std::chrono::seconds(pick(0, 3) ? 86400 * pick(1, 8) : pick(1, 700000))};
}

VSDateComponents History::pickInterval() {
    const VSDateComponents intervals[] = {{0, 0, 1, 0, 0, 0},  {0, 0, 1, 0, 0, 0}, {0, 0, 0, 1, 0, 0},
                                          {0, 0, 7, 0, 0, 0},  {0, 1, 0, 0, 0, 0}, {1, 0, 0, 0, 0, 0},
                                          {0, 0, 0, 0, 30, 0}, {0, 0, 0, 0, 7, 0}};
    return intervals[pick(0, 9) == 0 ? 7 : pick(0, 6)];
}

}  // namespace test
