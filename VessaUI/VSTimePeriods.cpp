#include "VessaUI/VSTimePeriods.h"

#include <algorithm>

namespace {

/// The midnight in the middle of the noon-to-noon day that holds the date.
VSDate midnightOfNoonDay(VSDate date, const VSCalendar& calendar) {
    const VSDate day = calendar.startOfDay(date);
    return date < calendar.noonOfDay(date) ? day : calendar.addDays(day, 1);
}

std::vector<VSDate> bucketBorders(VSDate start, VSDate end, const VSDateComponents& interval, bool noonDays,
                                  const VSCalendar& calendar) {
    if (!noonDays) return calendar.bucketBoundaries(start, interval, start, end);
    // A day more at the end, for the half day that the borders are moved back.
    const VSDate anchor = midnightOfNoonDay(start, calendar);
    std::vector<VSDate> borders =
        calendar.bucketBoundaries(anchor, interval, anchor, calendar.addDays(end, 1));
    for (VSDate& border : borders) border = calendar.yesterdayAtNoon(border);
    while (borders.size() > 2 && borders[borders.size() - 2] >= end) borders.pop_back();
    return borders;
}

}  // namespace

std::vector<VSTimeSpan> VSCoalesceTimePeriodsFromSamples(const std::vector<VSSamplePtr>& samples,
                                                         std::optional<VSDate> clipStart,
                                                         std::optional<VSDate> clipEnd) {
    std::vector<VSTimeSpan> spans;
    spans.reserve(samples.size());
    for (const VSSamplePtr& sample : samples) {
        VSTimeSpan span{sample->startDate(), sample->endDate()};
        if (clipStart) span.start = std::max(span.start, *clipStart);
        if (clipEnd) span.end = std::min(span.end, *clipEnd);
        if (span.start <= span.end) spans.push_back(span);
    }
    std::sort(spans.begin(), spans.end(),
              [](const VSTimeSpan& a, const VSTimeSpan& b) { return a.start < b.start; });
    std::vector<VSTimeSpan> joined;
    for (const VSTimeSpan& span : spans) {
        if (!joined.empty() && span.start <= joined.back().end)
            joined.back().end = std::max(joined.back().end, span.end);
        else
            joined.push_back(span);
    }
    return joined;
}

std::vector<VSDurationInBucket> VSCalculateTotalDurations(const std::vector<VSTimeSpan>& spans, VSDate start,
                                                          VSDate end, const VSDateComponents& interval,
                                                          bool noonDays, const VSCalendar& calendar) {
    const std::vector<VSDate> borders = bucketBorders(start, end, interval, noonDays, calendar);
    std::vector<VSDurationInBucket> totals;
    size_t first = 0;  // of the spans that may still meet the bucket
    for (size_t i = 0; i + 1 < borders.size(); ++i) {
        const VSTimeSpan bucket{borders[i], borders[i + 1]};
        const VSTimeSpan counted{std::max(bucket.start, start), std::min(bucket.end, end)};
        VSDuration total{0};
        bool met = false;
        while (first < spans.size() && spans[first].end < counted.start) ++first;
        for (size_t s = first; s < spans.size() && spans[s].start < counted.end; ++s) {
            const VSDuration part =
                std::min(spans[s].end, counted.end) - std::max(spans[s].start, counted.start);
            // A span that ends on the border belongs to the bucket before; one without length to that which
            // it starts.
            if (part <= VSDuration::zero() && spans[s].start < counted.start) continue;
            met = true;
            total += part;
        }
        if (met) totals.push_back({bucket, VSSecondsFromDuration(total) / 3600});
    }
    return totals;
}
