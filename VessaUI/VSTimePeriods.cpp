#include "VessaUI/VSTimePeriods.h"

#include <algorithm>
#include <map>

#include "Vessa/Base/VSCivil.h"
#include "Vessa/Base/VSHomeOffsets.h"

namespace {

constexpr VSDuration aDay = std::chrono::hours(24);

/// Where on the calendar's clock the hours stand that were on the clock where a sample was recorded.
class RecordedHours {
 public:
    explicit RecordedHours(const VSCalendar& calendar) : calendar_(calendar), home_(calendar) {}

    /// How much later than at its moment.
    VSDuration shift(const VSSample& sample) {
        const auto recorded = sample.timeZoneOffset();
        const VSDate start = sample.startDate();
        if (!recorded || *recorded == calendar_.secondsFromGMT(start) || home_.contains(*recorded, start))
            return VSDuration::zero();
        return momentOfClock(start.microseconds() + *recorded * civil::kSecond).value_or(start) - start;
    }

 private:
    /// The moment at which the calendar's clock shows this time, which is given as if it were that of
    /// Greenwich.
    std::optional<VSDate> momentOfClock(int64_t clock) const {
        const int64_t days = civil::floorDivide(clock, civil::kDay);
        const civil::CivilDay day = civil::civilFromDays(days);
        const int64_t rest = clock - days * civil::kDay;
        const auto part = [rest](int64_t unit, int64_t limit) {
            return static_cast<int>(rest / unit % limit);
        };
        const auto moment =
            calendar_.date(static_cast<int>(day.year), day.month, day.day, part(civil::kHour, 24),
                           part(civil::kMinute, 60), part(civil::kSecond, 60));
        if (!moment) return std::nullopt;
        return *moment + VSDuration(rest % civil::kSecond);
    }

    const VSCalendar& calendar_;
    VSHomeOffsets home_;
};

/// A part of a sample that counts.
struct Piece {
    VSTimeSpan span;
    VSDuration shift{0};
};
using Pieces = std::vector<Piece>;
using Spans = std::vector<VSTimeSpan>;

void sortByStart(Pieces& pieces) {
    std::stable_sort(pieces.begin(), pieces.end(),
                     [](const Piece& a, const Piece& b) { return a.span.start < b.span.start; });
}

/// What one source says.
struct Account {
    Pieces counted;
    Spans watched;  // the time of all its samples, where not all count
};

/// Each moment once; of two pieces with different shifts the earlier has what they share.
Pieces withoutOverlap(Pieces pieces) {
    sortByStart(pieces);
    Pieces result;
    for (Piece piece : pieces) {
        if (!result.empty()) {
            Piece& last = result.back();
            if (piece.shift == last.shift && piece.span.start <= last.span.end) {
                last.span.end = std::max(last.span.end, piece.span.end);
                continue;
            }
            piece.span.start = std::max(piece.span.start, last.span.end);
            if (piece.span.end <= last.span.end) continue;
        }
        result.push_back(piece);
    }
    return result;
}

Spans joined(Spans spans) {
    std::sort(spans.begin(), spans.end(),
              [](const VSTimeSpan& a, const VSTimeSpan& b) { return a.start < b.start; });
    Spans result;
    for (const VSTimeSpan& span : spans) {
        if (!result.empty() && span.start <= result.back().end)
            result.back().end = std::max(result.back().end, span.end);
        else
            result.push_back(span);
    }
    return result;
}

/// The stretches without a gap in which something counts.
Spans watchedTime(const Account& account) {
    Spans all = account.watched;
    for (const Piece& piece : account.counted) all.push_back(piece.span);
    Spans stretches = joined(std::move(all));
    auto piece = account.counted.begin();
    std::erase_if(stretches, [&](const VSTimeSpan& stretch) {
        while (piece != account.counted.end() && piece->span.end < stretch.start) ++piece;
        for (auto next = piece; next != account.counted.end() && next->span.start < stretch.end; ++next)
            if (next->span.length() > VSDuration::zero()) return false;
        return true;
    });
    return stretches;
}

/// The parts of the pieces that lie outside of what is taken. Both ascending and without overlap.
Pieces outside(const Pieces& pieces, const Spans& taken) {
    Pieces result;
    auto first = taken.begin();
    for (Piece piece : pieces) {
        while (first != taken.end() && first->end <= piece.span.start) ++first;
        if (piece.span.length() == VSDuration::zero()) {
            if (first == taken.end() || first->start > piece.span.start) result.push_back(piece);
            continue;
        }
        for (auto next = first; next != taken.end() && next->start < piece.span.end; ++next) {
            if (next->start > piece.span.start)
                result.push_back({{piece.span.start, next->start}, piece.shift});
            piece.span.start = std::min(next->end, piece.span.end);
        }
        if (piece.span.start < piece.span.end) result.push_back(piece);
    }
    return result;
}

VSTimeSpan spanOfSample(const VSSample& sample, VSDuration shift, const VSTimePeriodRules& rules,
                        const VSCalendar& calendar) {
    VSTimeSpan span{sample.startDate(), sample.endDate()};
    if (rules.nights && span.length() > aDay) {
        const VSDate day = VSStartOfNoonDay(span.start + shift, calendar);
        span.end = VSEndOfNoonDay(day, calendar) - shift;
    }
    span.end = std::min(span.end, rules.now);
    return span;
}

std::vector<Account> accounts(const std::vector<VSSamplePtr>& samples, const VSTimePeriodRules& rules,
                              const VSCalendar& calendar) {
    std::vector<Account> byRank(rules.sources.size() + 1);
    std::map<const VSSourceRevision*, size_t> ranks;
    RecordedHours recordedHours(calendar);
    for (const VSSamplePtr& sample : samples) {
        if (sample->startDate() > rules.now) continue;
        const VSSourceRevision& revision = sample->sourceRevision();
        const auto [rank, isNew] = ranks.try_emplace(&revision);
        if (isNew)
            rank->second =
                static_cast<size_t>(std::find(rules.sources.begin(), rules.sources.end(), revision.source) -
                                    rules.sources.begin());
        const VSDuration shift = rules.nights ? recordedHours.shift(*sample) : VSDuration::zero();
        const VSTimeSpan span = spanOfSample(*sample, shift, rules, calendar);
        if (!rules.counted || rules.counted->matches(*sample))
            byRank[rank->second].counted.push_back({span, shift});
        else
            byRank[rank->second].watched.push_back(span);
    }
    for (Account& account : byRank) account.counted = withoutOverlap(std::move(account.counted));
    return byRank;
}

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

VSDate VSStartOfNoonDay(VSDate date, const VSCalendar& calendar) {
    const VSDate noon = calendar.noonOfDay(date);
    return date < noon ? calendar.yesterdayAtNoon(date) : noon;
}

VSDate VSEndOfNoonDay(VSDate date, const VSCalendar& calendar) {
    return calendar.noonOfDay(midnightOfNoonDay(date, calendar));
}

VSDate VSStartOfNight(const VSSample& sample, const VSCalendar& calendar) {
    return sample.startDate() + RecordedHours(calendar).shift(sample);
}

VSDate VSLastMomentOfSpan(const VSTimeSpan& span, const VSCalendar& calendar) {
    const bool endsADay = span.start < span.end && calendar.startOfDay(span.end) == span.end;
    return endsADay ? std::max(span.start, span.end - std::chrono::seconds(1)) : span.end;
}

VSDate VSLastMomentOfSample(const VSSample& sample, const VSCalendar& calendar) {
    return VSLastMomentOfSpan({sample.startDate(), sample.endDate()}, calendar);
}

bool VSContinuesSection(VSDate last, VSDate start, const VSCalendar& calendar) {
    return start - last <= VSMaximumGapForConsecutiveSections &&
           calendar.startOfDay(start) <= calendar.addDays(calendar.startOfDay(last), 1);
}

std::vector<VSTimeSpan> VSCoalesceTimePeriodsFromSamples(const std::vector<VSSamplePtr>& samples,
                                                         const VSTimePeriodRules& rules,
                                                         const VSCalendar& calendar) {
    Pieces pieces;
    Spans taken;
    for (const Account& account : accounts(samples, rules, calendar)) {
        const Pieces own = outside(account.counted, taken);
        pieces.insert(pieces.end(), own.begin(), own.end());
        const Spans watched = watchedTime(account);
        taken.insert(taken.end(), watched.begin(), watched.end());
        taken = joined(std::move(taken));
    }
    Spans spans;
    pieces = withoutOverlap(std::move(pieces));
    spans.reserve(pieces.size());
    for (const Piece& piece : pieces)
        spans.push_back({piece.span.start + piece.shift, piece.span.end + piece.shift});
    std::stable_sort(spans.begin(), spans.end(),
                     [](const VSTimeSpan& a, const VSTimeSpan& b) { return a.start < b.start; });
    return spans;
}

std::vector<VSDurationInBucket> VSCalculateTotalDurations(const std::vector<VSTimeSpan>& spans, VSDate start,
                                                          VSDate end, const VSDateComponents& interval,
                                                          bool noonDays, const VSCalendar& calendar) {
    const std::vector<VSDate> borders = bucketBorders(start, end, interval, noonDays, calendar);
    std::vector<VSDuration> totals(borders.size(), VSDuration::zero());
    for (const VSTimeSpan& span : spans) {
        const VSDate from = std::max({span.start, start, borders.front()});
        const VSDate to = std::min({span.end, end, borders.back()});
        auto border = std::upper_bound(borders.begin(), borders.end(), from);
        for (VSDate at = from; at < to; at = *border++)
            totals[static_cast<size_t>(border - borders.begin()) - 1] += std::min(*border, to) - at;
    }
    std::vector<VSDurationInBucket> result;
    for (size_t i = 0; i + 1 < borders.size(); ++i)
        if (totals[i] > VSDuration::zero())
            result.push_back({{borders[i], borders[i + 1]}, VSSecondsFromDuration(totals[i]) / 3600});
    return result;
}
