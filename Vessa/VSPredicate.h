#pragma once

#include <optional>
#include <string>
#include <vector>

#include "Vessa/VSObject.h"

/// Options of a date predicate, a bit set. With none (0) a sample matches when its span meets [start, end):
/// it starts before `end` and ends after `start`, or has no length and lies at `start` or later.
/// StrictStartDate asks besides that it starts at `start` or later, StrictEndDate that it ends at `end` or
/// earlier.
enum VSQueryOptions : int {
    VSQueryOptionNone = 0,
    VSQueryOptionStrictStartDate = 1,
    VSQueryOptionStrictEndDate = 2
};

/// A condition on samples: the conjunction of everything set here. Plain value; `a & b` joins two.
struct VSPredicate {
    std::optional<VSDate> startDate, endDate;
    int dateOptions = VSQueryOptionNone;
    // Beside the range above:
    std::optional<VSDate> startsBefore;  // the sample starts before this moment
    std::optional<VSDate> startsFrom;    // starts at this moment or later
    std::optional<VSDate> endsBy;        // ends at this moment or earlier
    std::vector<VSSource> sources;       // of one of these; empty: of any
    std::optional<VSDevice> device;
    std::vector<std::pair<std::string, VSValue>> metadata;  // each key has this value
    std::vector<std::string> metadataKeys;                  // each key is present
    std::optional<int> categoryValue;
    bool noCorrelation = false;  // not a member of a correlation

    static VSPredicate samplesWithStartDate(std::optional<VSDate> start, std::optional<VSDate> end,
                                            int options);
    static VSPredicate samplesStartingBefore(VSDate date);
    static VSPredicate withMetadata(std::string key, VSValue value);
    static VSPredicate withCategoryValue(int value);
    /// Nothing but (perhaps) a date range with options 0: what statistics answer from rollups.
    bool isDateRangeOnly() const;
    bool matches(const VSSample& sample) const;  // all but noCorrelation, which only the store knows
    /// What matches both, whatever they ask. Conditions that contradict each other (two category values)
    /// become a date range in the distant future; two ranges with different options become one without, and
    /// what the options asked stands in startsFrom and endsBy.
    friend VSPredicate operator&(VSPredicate a, const VSPredicate& b);
};
