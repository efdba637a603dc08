#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <utility>
#include <vector>

#include "Vessa/VSObject.h"

/// What a record of a category or a workout says, by its identifier, or its number where it has none; empty
/// for other records.
std::string QVValueText(const VSSample& sample);

/// How many records start in each interval, and how much time they take in it: each moment once, however many
/// records of the same value lie in it. Of a workout that rested the moments count less, so that the whole of
/// it takes as long as it says. One thread.
class QVDurationStatistics {
 public:
    struct Tally {
        int64_t count = 0;
        double seconds = 0;
    };
    /// By value, then by source; the source "" is all of them together.
    using Key = std::pair<std::string, std::string>;

    /// The intervals between the boundaries, which ascend; nothing outside of [from, to) counts. Else than by
    /// value records are only counted, all under the value "".
    QVDurationStatistics(std::vector<VSDate> boundaries, VSDate from, VSDate to, bool byValue)
        : boundaries_(std::move(boundaries)),
          from_(from),
          to_(to),
          byValue_(byValue),
          intervals_(boundaries_.size() - 1) {}

    /// REQUIRES: in the order of their starts.
    void add(const VSSample& sample);

    size_t count() const { return intervals_.size(); }
    VSDate start(size_t interval) const { return boundaries_[interval]; }
    VSDate end(size_t interval) const { return boundaries_[interval + 1]; }
    const std::map<Key, Tally>& tallies(size_t interval) const { return intervals_[interval]; }

 private:
    void add(const VSSample& sample, const Key& key, double rate);
    size_t intervalOf(VSDate date) const;

    const std::vector<VSDate> boundaries_;
    const VSDate from_, to_;
    const bool byValue_;
    std::vector<std::map<Key, Tally>> intervals_;
    std::map<Key, VSDate> coveredUntil_;
};
