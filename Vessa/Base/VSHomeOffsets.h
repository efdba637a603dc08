#pragma once

#include <map>
#include <utility>

#include "Vessa/Base/VSCalendar.h"

/// Which offsets from Greenwich a zone has itself, in one season or the other. A record with such an offset
/// was made at home; another tells of a journey. Remembers what it was asked; used by one thread.
class VSHomeOffsets {
 public:
    explicit VSHomeOffsets(VSCalendar calendar) : calendar_(std::move(calendar)) {}
    /// Whether the calendar's zone has the offset, in seconds, at some time of the year around the date.
    bool contains(int offset, VSDate date);

 private:
    const VSCalendar calendar_;
    std::map<std::pair<int, int64_t>, bool> known_;  // by offset and month
};
