#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

/// The changes of a time zone's offset, taken from ICU once and kept for the life of the process, so that
/// reckoning a local time is a binary search. Times are whole microseconds since 1970, offsets microseconds
/// east of Greenwich. Immutable; any thread.
class VSZoneTable {
 public:
    /// The table of a zone; made at the first question for it. A zone that ICU does not know counts as UTC.
    static std::shared_ptr<const VSZoneTable> forZone(const std::string& identifier);
    explicit VSZoneTable(const std::string& identifier);

    int64_t offsetAt(int64_t time) const;
    /// The instant of a local time (microseconds since 1970 as the clock on the wall shows them): in a gap
    /// the first moment after it, in an overlap the first of the two.
    int64_t instantOfLocal(int64_t local) const;
    /// The day that the moment belongs to (days since 1970): the last that has begun.
    int64_t dayOf(int64_t time) const;
    /// The first moment after which the clock shows no earlier day than this one: behind the gap where the
    /// clock goes forward over midnight, and at the second midnight where it goes back to the day before. A
    /// day that the zone left out starts with the next.
    int64_t startOfDay(int64_t day) const;
    /// The last change at or before the time, or INT64_MIN.
    int64_t lastChangeAt(int64_t time) const;

 private:
    struct Change {
        int64_t time;    // from this moment on ...
        int64_t offset;  // ... this offset holds
    };

    void readChanges(const std::string& identifier);
    const Change* periodOfLocal(int64_t local) const;

    std::vector<Change> changes_;  // ascending; the first is at INT64_MIN
};
