#pragma once

#include <optional>
#include <vector>

#include "Vessa/Base/VSCalendar.h"
#include "Vessa/VSPredicate.h"

// Arithmetic of spans of time, for display types whose samples last (sleep, workouts) or merely happen. Pure
// functions; any thread. Calendar steps are those of the calendar given.

/// A span from its start up to, not including, its end; start <= end. Plain value.
struct VSTimeSpan {
    VSDate start, end;
    VSDuration length() const { return end - start; }
    friend bool operator==(const VSTimeSpan&, const VSTimeSpan&) = default;
};

/// How samples become spans. Plain value.
struct VSTimePeriodRules {
    /// The samples whose time counts (asleep); none: all do. The others (in bed) tell that their source was
    /// watching.
    std::optional<VSPredicate> counted;
    /// The order in which sources count. One that is not in it comes after all that are.
    std::vector<VSSource> sources;
    /// What has begun and has not ended by now has lasted until now; what has not begun does not count.
    VSDate now;
    /// Days reach from noon to noon, and a night stands at the hours at which the sleeper lived it.
    bool nights = false;
};

/// The time of the samples that count, each moment once; ascending by start. Overlapping and touching spans
/// are joined; one without length stays one where no other holds it.
///
/// Several sources: a moment belongs to the first source that was watching, whatever the others say of it. A
/// source watches as long as its samples, counted or not, follow each other without a gap, if one of them
/// counts: an hour awake in a night in bed is not filled by another tracker, while one that knows only when
/// the person lay down hides nobody's sleep. In its gaps the next source counts. (For samples that all count
/// the total is that of a sum: a moment counts once.)
///
/// Nights: a span stands at the clock time that its sample's recorded offset gives it, on the calendar's
/// clock, and keeps its length; spans lived in different zones may overlap there, and both count. An offset
/// that the calendar's zone has itself within half a year tells of no journey (a document gives all its dates
/// the offset of the day on which it was made), and neither does none: these stand where they are. A sample
/// longer than a day is one that nobody ended; it lasts until the noon after its start.
std::vector<VSTimeSpan> VSCoalesceTimePeriodsFromSamples(const std::vector<VSSamplePtr>& samples,
                                                         const VSTimePeriodRules& rules,
                                                         const VSCalendar& calendar);

/// How far from its moment a night may stand: offsets lie between -12 and +14 hours.
inline constexpr VSDuration VSGreatestShiftOfNights = std::chrono::hours(26);

/// Where the sample starts, as VSCoalesceTimePeriodsFromSamples places it under the rules of nights.
VSDate VSStartOfNight(const VSSample& sample, const VSCalendar& calendar);

/// Noon of the day that the date lies in, or of the day before: the start of its noon-to-noon day.
VSDate VSStartOfNoonDay(VSDate date, const VSCalendar& calendar);
/// The start of the next.
VSDate VSEndOfNoonDay(VSDate date, const VSCalendar& calendar);

struct VSDurationInBucket {
    VSTimeSpan bucket;
    double hours = 0;
};
/// How long the spans last in each bucket of [start, end), a span over a border being cut there: each bucket
/// gets the time that lies in it. Time is what passes, also where the clocks change. The buckets are the
/// interval's, counted from `start`; with `noonDays` they are those of the calendar day that begins in the
/// middle of the noon-to-noon day of `start`, each border moved to noon of the day before, so that a month of
/// nights is a calendar month. The first and last bucket are told whole, though only what lies in [start,
/// end) counts. Only buckets in which some time lies, ascending. REQUIRES: spans ascending by start (they may
/// overlap; then each counts), a positive interval, start < end.
std::vector<VSDurationInBucket> VSCalculateTotalDurations(const std::vector<VSTimeSpan>& spans, VSDate start,
                                                          VSDate end, const VSDateComponents& interval,
                                                          bool noonDays, const VSCalendar& calendar);

/// When what a span or a sample tells was last so, for texts that name the day: its end, but where that is
/// the midnight that ends its last day, the second before.
VSDate VSLastMomentOfSpan(const VSTimeSpan& span, const VSCalendar& calendar);
VSDate VSLastMomentOfSample(const VSSample& sample, const VSCalendar& calendar);

/// The longest time that can lie between two moments of days that follow each other, of which one may have 25
/// hours. Days further apart never belong together.
inline constexpr VSDuration VSMaximumGapForConsecutiveSections = std::chrono::hours(49);
/// Whether a record that starts then goes on with what was so until `last` (VSLastMomentOfSample): on the
/// same calendar day, an earlier one or the next. No length of time alone would tell: 34 hours lie between a
/// morning and the evening of the next day, and between an evening and the morning after the next, which has
/// left a day out.
bool VSContinuesSection(VSDate last, VSDate start, const VSCalendar& calendar);
