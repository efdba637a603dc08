#pragma once

#include <algorithm>
#include <cstdint>
#include <utility>
#include <vector>

/// A sample in the eyes of a merged sum. `rank` is the place of its source in the order of sources.
struct VSRankedSpan {
    int64_t start, duration;
    double value;
    size_t rank;
    int64_t end() const { return start + duration; }
};

/// Moments that samples cover, as separate spans in ascending order.
class VSSpanCover {
 public:
    bool contains(int64_t moment) const {
        const auto next = after(moment);
        return next != spans_.begin() && moment < std::prev(next)->second;
    }
    /// Calls block(from, to) for each part of [from, to) that is not covered.
    template <typename Block>
    void forEachGap(int64_t from, int64_t to, Block block) const {
        auto next = after(from);
        if (next != spans_.begin()) from = std::max(from, std::prev(next)->second);
        for (; next != spans_.end() && next->first < to; ++next) {
            if (from < next->first) block(from, next->first);
            from = std::max(from, next->second);
        }
        if (from < to) block(from, to);
    }
    void add(const std::vector<std::pair<int64_t, int64_t>>& spans) {
        spans_.insert(spans_.end(), spans.begin(), spans.end());
        std::sort(spans_.begin(), spans_.end());
        size_t kept = 0;
        for (const auto& span : spans_) {
            if (kept && span.first <= spans_[kept - 1].second)
                spans_[kept - 1].second = std::max(spans_[kept - 1].second, span.second);
            else
                spans_[kept++] = span;
        }
        spans_.resize(kept);
    }

 private:
    std::vector<std::pair<int64_t, int64_t>>::const_iterator after(int64_t moment) const {
        return std::upper_bound(spans_.begin(), spans_.end(), moment,
                                [](int64_t value, const auto& span) { return value < span.first; });
    }
    std::vector<std::pair<int64_t, int64_t>> spans_;
};

/// Calls block(span, from, to) for each part of the spans inside of [begin, end) that no span of a lower rank
/// covers. A span without length has the part (start, start), unless its moment is covered. Sorts the spans.
template <typename Block>
void VSForEachCountedPart(std::vector<VSRankedSpan>& spans, int64_t begin, int64_t end, Block block) {
    std::stable_sort(spans.begin(), spans.end(),
                     [](const VSRankedSpan& a, const VSRankedSpan& b) { return a.rank < b.rank; });
    VSSpanCover cover;
    std::vector<std::pair<int64_t, int64_t>> ofThisRank;
    for (size_t place = 0; place < spans.size(); ++place) {
        const VSRankedSpan& span = spans[place];
        if (place && span.rank != spans[place - 1].rank) {
            cover.add(ofThisRank);
            ofThisRank.clear();
        }
        if (span.duration == 0) {
            if (!cover.contains(span.start)) block(span, span.start, span.start);
            continue;
        }
        const int64_t from = std::max(span.start, begin), to = std::min(span.end(), end);
        cover.forEachGap(from, to, [&](int64_t a, int64_t b) { block(span, a, b); });
        ofThisRank.emplace_back(from, to);
    }
}
