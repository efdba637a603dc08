#pragma once

#include <optional>
#include <vector>

#include "Vessa/Base/VSCalendar.h"
#include "Vessa/VSObject.h"

// Arithmetic of spans of time, for display types whose samples last (sleep, workouts) or merely happen. Pure
// functions; any thread. Calendar steps are those of the calendar given.

/// A span [start, end], start <= end. Plain value.
struct VSTimeSpan {
    VSDate start, end;
    VSDuration length() const { return end - start; }
    friend bool operator==(const VSTimeSpan&, const VSTimeSpan&) = default;
};

/// The spans of the samples, overlapping and touching ones joined, ascending. With clip dates only what lies
/// between them, and only of samples that meet that range; a sample without length stays one.
std::vector<VSTimeSpan> VSCoalesceTimePeriodsFromSamples(const std::vector<VSSamplePtr>& samples,
                                                         std::optional<VSDate> clipStart = {},
                                                         std::optional<VSDate> clipEnd = {});

struct VSDurationInBucket {
    VSTimeSpan bucket;
    double hours = 0;
};
/// How long the spans last in each bucket of [start, end), a span over a border being cut there. The buckets
/// are the interval's, counted from `start`; with `noonDays` they are those of the calendar day that begins
/// in the middle of the noon-to-noon day of `start`, each border moved to noon of the day before, so that a
/// month of nights is a calendar month. Only buckets that a span meets, ascending. REQUIRES: spans as
/// VSCoalesceTimePeriodsFromSamples gives them, a positive interval, start < end.
std::vector<VSDurationInBucket> VSCalculateTotalDurations(const std::vector<VSTimeSpan>& spans, VSDate start,
                                                          VSDate end, const VSDateComponents& interval,
                                                          bool noonDays, const VSCalendar& calendar);

/// Days of the same kind follow each other when no more than this lies between the end of one record and the
/// start of the next: from a morning to the evening of the next day.
inline constexpr VSDuration VSMaximumGapForConsecutiveSections = std::chrono::hours(36);
