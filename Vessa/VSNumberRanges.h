#pragma once

#include <cstdint>
#include <vector>

/// Both ends are included.
struct VSNumberRange {
    int64_t first = 0, last = 0;
    friend bool operator==(const VSNumberRange&, const VSNumberRange&) = default;
};

/// A set of objects' numbers as ranges, ascending and apart from each other.
class VSNumberRanges {
 public:
    VSNumberRanges() = default;
    /// Nothing where last < first.
    VSNumberRanges(int64_t first, int64_t last) { append({first, last}); }
    /// In any order, overlapping or not.
    static VSNumberRanges of(std::vector<VSNumberRange> ranges);

    /// REQUIRES: it begins behind all that is there.
    void append(VSNumberRange range);
    bool isEmpty() const { return ranges_.empty(); }
    bool contains(int64_t number) const;
    /// The least number of the set from this one on; 0: there is none.
    int64_t nextFrom(int64_t number) const;
    /// The greatest number; 0: there is none.
    int64_t last() const { return ranges_.empty() ? 0 : ranges_.back().last; }
    const std::vector<VSNumberRange>& ranges() const { return ranges_; }

    VSNumberRanges united(const VSNumberRanges& other) const;
    VSNumberRanges intersected(const VSNumberRanges& other) const;
    VSNumberRanges without(const VSNumberRanges& other) const;

    friend bool operator==(const VSNumberRanges&, const VSNumberRanges&) = default;

 private:
    std::vector<VSNumberRange> ranges_;
};
