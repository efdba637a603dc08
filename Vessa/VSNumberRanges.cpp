#include "Vessa/VSNumberRanges.h"

#include <algorithm>

VSNumberRanges VSNumberRanges::of(std::vector<VSNumberRange> ranges) {
    std::sort(ranges.begin(), ranges.end(),
              [](const VSNumberRange& a, const VSNumberRange& b) { return a.first < b.first; });
    VSNumberRanges result;
    for (const VSNumberRange& range : ranges) {
        if (!result.ranges_.empty() && range.first <= result.ranges_.back().last + 1)
            result.ranges_.back().last = std::max(result.ranges_.back().last, range.last);
        else
            result.append(range);
    }
    return result;
}

void VSNumberRanges::append(VSNumberRange range) {
    if (range.last < range.first) return;
    if (!ranges_.empty() && range.first == ranges_.back().last + 1)
        ranges_.back().last = range.last;
    else
        ranges_.push_back(range);
}

int64_t VSNumberRanges::nextFrom(int64_t number) const {
    const auto range =
        std::lower_bound(ranges_.begin(), ranges_.end(), number,
                         [](const VSNumberRange& candidate, int64_t n) { return candidate.last < n; });
    return range == ranges_.end() ? 0 : std::max(range->first, number);
}

bool VSNumberRanges::contains(int64_t number) const {
    return nextFrom(number) == number;
}

VSNumberRanges VSNumberRanges::united(const VSNumberRanges& other) const {
    std::vector<VSNumberRange> both = ranges_;
    both.insert(both.end(), other.ranges_.begin(), other.ranges_.end());
    return of(std::move(both));
}

VSNumberRanges VSNumberRanges::intersected(const VSNumberRanges& other) const {
    VSNumberRanges result;
    auto a = ranges_.begin(), b = other.ranges_.begin();
    while (a != ranges_.end() && b != other.ranges_.end()) {
        result.append({std::max(a->first, b->first), std::min(a->last, b->last)});
        ++(a->last < b->last ? a : b);
    }
    return result;
}

VSNumberRanges VSNumberRanges::without(const VSNumberRanges& other) const {
    VSNumberRanges result;
    auto b = other.ranges_.begin();
    for (const VSNumberRange& range : ranges_) {
        int64_t next = range.first;
        while (b != other.ranges_.end() && b->last < next) ++b;
        for (auto hole = b; hole != other.ranges_.end() && hole->first <= range.last; ++hole) {
            result.append({next, hole->first - 1});
            next = hole->last + 1;
        }
        result.append({next, range.last});
    }
    return result;
}
