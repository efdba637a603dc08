#include "Vessa/VSNumberRanges.h"

#include <gtest/gtest.h>

#include <random>
#include <set>

namespace {

std::set<int64_t> numbersOf(const VSNumberRanges& ranges) {
    std::set<int64_t> numbers;
    int64_t last = -1;
    for (const VSNumberRange& range : ranges.ranges()) {
        EXPECT_LE(range.first, range.last);
        EXPECT_GT(range.first, last + 1) << "neighbours are one range";
        last = range.last;
        for (int64_t number = range.first; number <= range.last; ++number) numbers.insert(number);
    }
    return numbers;
}

}  // namespace

TEST(VSNumberRanges, DoWhatSetsDo) {
    std::mt19937 random(7);
    const auto number = [&](int limit) {
        return static_cast<int64_t>(random() % static_cast<unsigned>(limit));
    };
    for (int round = 0; round < 500; ++round) {
        VSNumberRanges made[2];
        std::set<int64_t> sets[2];
        for (int side = 0; side < 2; ++side) {
            std::vector<VSNumberRange> ranges;
            for (int64_t count = number(6); count > 0; --count) {
                const int64_t first = 1 + number(40);
                ranges.push_back({first, first + number(8)});
                for (int64_t n = first; n <= ranges.back().last; ++n) sets[side].insert(n);
            }
            made[side] = VSNumberRanges::of(ranges);
        }
        const auto& [a, b] = sets;
        std::set<int64_t> both = a, common, only;
        both.insert(b.begin(), b.end());
        for (int64_t n : a) (b.contains(n) ? common : only).insert(n);
        EXPECT_EQ(numbersOf(made[0]), a);
        EXPECT_EQ(numbersOf(made[0].united(made[1])), both);
        EXPECT_EQ(numbersOf(made[0].intersected(made[1])), common);
        EXPECT_EQ(numbersOf(made[0].without(made[1])), only);
        for (int64_t n = 1; n < 52; ++n) {
            const auto next = a.lower_bound(n);
            EXPECT_EQ(made[0].nextFrom(n), next == a.end() ? 0 : *next);
            EXPECT_EQ(made[0].contains(n), a.contains(n));
        }
    }
}
