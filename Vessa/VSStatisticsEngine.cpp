#include "Vessa/VSStatisticsEngine.h"

#include <algorithm>

#include "Vessa/VSStoreSchema.h"

namespace {

/// Beyond this many partial quarters one pass over the samples is cheaper than rollups with a look at each.
constexpr size_t partialSegmentsAtMost = 16;

void requirePositive(const VSDateComponents& interval) {
    const int parts[] = {interval.years, interval.months,  interval.days,
                         interval.hours, interval.minutes, interval.seconds};
    if (interval.isZero() ||
        std::any_of(std::begin(parts), std::end(parts), [](int part) { return part < 0; }))
        throw VSDatabaseFailure({VSErrorCode::Invalid, "the interval of the buckets is not positive"});
}

}  // namespace

void VSStatisticsEngine::Gathered::addStarting(int64_t samples, const VSExactSum& total, double low,
                                               double high) {
    minimum = count ? std::min(minimum, low) : low;
    maximum = count ? std::max(maximum, high) : high;
    count += samples;
    startingSum += total;
}

void VSStatisticsEngine::Gathered::addShare(const VSExactSum& share) {
    touched = true;
    sum += share;
}

/// Walks over the days of one source's rollups.
class VSStatisticsEngine::RollupCursor {
 public:
    RollupCursor(VSDatabase& database, size_t sourceRank, int64_t first, int64_t last)
        : rank(sourceRank),
          rows_(database.use("SELECT slot, quarters FROM rollups WHERE slot BETWEEN ? AND ? ORDER BY slot")) {
        rows_.bind(1, first).bind(2, last);
        next();
    }
    void next() { valid = rows_.step(); }
    void skipTo(int64_t wanted) {
        while (valid && day() < wanted) next();
    }
    int64_t day() const { return VSRollupDayOfSlot(rows_.integer(0)); }
    std::string_view quarters() const { return rows_.blob(1); }

    const size_t rank;
    bool valid = false;

 private:
    VSStatement rows_;
};

VSStatisticsEngine::VSStatisticsEngine(VSStoreReader& reader, const VSObjectType* type,
                                       const VSPredicate& predicate, int options)
    : reader_(reader),
      type_(type),
      predicate_(predicate),
      options_(type->isQuantityType() ? options : options & VSStatisticsOptionSeparateBySource),
      separate_(options & VSStatisticsOptionSeparateBySource),
      fromRollups_(predicate.isDateRangeOnly()) {}

bool VSStatisticsEngine::findRange() {
    sources_ = reader_.orderedSources(type_);
    const auto extent = extentOfSources();
    if (!extent.count) return false;
    from_ = extent.firstStart;
    to_ = extent.lastEnd + 1;  // a sample without length lies at its end
    if (predicate_.startDate) from_ = std::max(from_, predicate_.startDate->microseconds());
    if (predicate_.endDate) to_ = std::min(to_, predicate_.endDate->microseconds());
    merging_ = sources_.size() > 1 && type_->isCumulative() && (options_ & VSStatisticsOptionCumulativeSum);
    return from_ < to_;
}

/// Of those that the predicate asks for: when others began and ended is not its business.
VSStoreReader::Extent VSStatisticsEngine::extentOfSources() const {
    const auto& wanted = predicate_.sources;
    if (wanted.empty()) return reader_.extent(type_);
    VSStoreReader::Extent extent;
    for (int64_t source : sources_) {
        if (std::find(wanted.begin(), wanted.end(), reader_.provenances().source(source)) == wanted.end())
            continue;
        const auto own = reader_.extent(type_, source);
        extent.count += own.count;
        extent.firstStart = std::min(extent.firstStart, own.firstStart);
        extent.lastEnd = std::max(extent.lastEnd, own.lastEnd);
    }
    return extent;
}

VSStatistics VSStatisticsEngine::statistics() {
    const bool hasData = findRange();
    const int64_t start = predicate_.startDate ? predicate_.startDate->microseconds() : from_;
    const int64_t end = predicate_.endDate ? predicate_.endDate->microseconds() : to_;
    if (hasData) {
        gather({start, end});
    } else {
        borders_ = {start, std::max(start, end)};
        gathered_.resize(1);
    }
    return finished(0);
}

std::vector<VSStatistics> VSStatisticsEngine::buckets(VSDate anchor, const VSDateComponents& interval,
                                                      const VSCalendar& calendar) {
    requirePositive(interval);
    std::vector<VSStatistics> result;
    if (!findRange()) return result;
    std::vector<int64_t> borders;
    for (VSDate border : calendar.bucketBoundaries(anchor, interval, VSDate::fromMicroseconds(from_),
                                                   VSDate::fromMicroseconds(to_)))
        borders.push_back(border.microseconds());
    if (borders.size() < 2) return result;
    gather(std::move(borders));
    const bool countsOnly = (options_ & ~VSStatisticsOptionSeparateBySource) == 0;
    for (size_t bucket = 0; bucket < gathered_.size(); ++bucket) {
        if (!gathered_[bucket].touched && !gathered_[bucket].count) continue;
        VSStatistics statistics = finished(bucket);
        if (countsOnly ? statistics.count > 0 : statistics.hasData()) result.push_back(std::move(statistics));
    }
    return result;
}

void VSStatisticsEngine::gather(std::vector<int64_t> borders) {
    borders_ = std::move(borders);
    gathered_.resize(borders_.size() - 1);
    if (separate_) ofSource_.assign(gathered_.size(), std::vector<Gathered>(sources_.size()));
    for (const Segment& segment : segments()) {
        if (segment.rolledUp)
            gatherRollups(segment);
        else
            gatherSamples(segment, All);
    }
}

/// Cuts the range into parts that rollups answer and parts that need the samples.
std::vector<VSStatisticsEngine::Segment> VSStatisticsEngine::segments() const {
    std::vector<Segment> result;
    size_t partial = 0;
    const auto append = [&](int64_t from, int64_t to, bool rolledUp) {
        if (from >= to) return;
        if (!result.empty() && result.back().rolledUp == rolledUp && result.back().to == from) {
            result.back().to = to;
            return;
        }
        result.push_back({from, to, rolledUp});
        if (!rolledUp) ++partial;
    };
    const int64_t end = borders_.back();
    for (size_t bucket = 0; fromRollups_ && bucket + 1 < borders_.size() && partial <= partialSegmentsAtMost;
         ++bucket) {
        // Nothing lies before or after the data: there its border may as well be the quarter's.
        int64_t from = std::max(borders_[bucket],
                                predicate_.startDate ? predicate_.startDate->microseconds() : INT64_MIN);
        int64_t to = std::min(borders_[bucket + 1],
                              predicate_.endDate ? predicate_.endDate->microseconds() : INT64_MAX);
        if (from < from_) from = VSFloorDivide(from_, VSQuarterMicroseconds) * VSQuarterMicroseconds;
        if (to > to_) to = VSCeilingDivide(to_, VSQuarterMicroseconds) * VSQuarterMicroseconds;
        const int64_t wholeFrom = VSCeilingDivide(from, VSQuarterMicroseconds) * VSQuarterMicroseconds;
        const int64_t wholeTo = VSFloorDivide(to, VSQuarterMicroseconds) * VSQuarterMicroseconds;
        if (wholeFrom >= wholeTo) {
            append(from, to, false);
            continue;
        }
        append(from, wholeFrom, false);
        append(wholeFrom, wholeTo, true);
        append(wholeTo, to, false);
    }
    if (!fromRollups_ || partial > partialSegmentsAtMost) return {{from_, std::min(to_, end), false}};
    return result;
}

void VSStatisticsEngine::gatherRollups(const Segment& segment) {
    std::vector<Segment> conflicts;
    gatherLongSpans(segment, conflicts);
    const int64_t firstDay = VSFloorDivide(segment.from, VSDayMicroseconds),
                  lastDay = VSFloorDivide(segment.to - 1, VSDayMicroseconds);
    const int type = VSTypeCodeValue(type_->code());
    std::vector<std::unique_ptr<RollupCursor>> cursors;
    for (size_t rank = 0; rank < sources_.size(); ++rank) {
        cursors.push_back(std::make_unique<RollupCursor>(reader_.database(), rank,
                                                         VSRollupSlot(type, sources_[rank], firstDay),
                                                         VSRollupSlot(type, sources_[rank], lastDay)));
    }
    RollupCursor merged(reader_.database(), 0, VSRollupSlot(type, VSMergedSource, firstDay),
                        VSRollupSlot(type, VSMergedSource, lastDay));
    // Rows that were merged in another order are of no use.
    if (!merging_ || VSOrderOfMergedRows(reader_.database(), type) != sources_) merged.valid = false;
    std::vector<RollupCursor*> today;
    for (;;) {
        int64_t day = INT64_MAX;
        for (const auto& cursor : cursors) {
            if (cursor->valid) day = std::min(day, cursor->day());
        }
        if (day == INT64_MAX) break;
        today.clear();
        for (const auto& cursor : cursors) {
            if (cursor->valid && cursor->day() == day) today.push_back(cursor.get());
        }
        merged.skipTo(day);
        gatherDay(day, today, merged, segment, conflicts);
        for (RollupCursor* cursor : today) cursor->next();
    }
    cursors.clear();
    for (const Segment& conflict : united(std::move(conflicts))) gatherSamples(conflict, Merged);
}

/// The same moments in separate segments, ascending.
std::vector<VSStatisticsEngine::Segment> VSStatisticsEngine::united(std::vector<Segment> segments) {
    std::sort(segments.begin(), segments.end(),
              [](const Segment& a, const Segment& b) { return a.from < b.from; });
    std::vector<Segment> result;
    for (const Segment& segment : segments) {
        if (!result.empty() && segment.from <= result.back().to)
            result.back().to = std::max(result.back().to, segment.to);
        else
            result.push_back(segment);
    }
    return result;
}

void VSStatisticsEngine::gatherDay(int64_t day, const std::vector<RollupCursor*>& cursors,
                                   const RollupCursor& merged, const Segment& segment,
                                   std::vector<Segment>& conflicts) {
    const int64_t dayStart = day * VSDayMicroseconds;
    VSQuarterBits once = 0, twice = 0, metByLongSpans = 0;  // quarters with samples of one source, of several
    if (merging_) {
        for (const RollupCursor* cursor : cursors) {
            const VSQuarterBits present = VSQuartersPresent(cursor->quarters());
            twice |= once & present;
            once |= present;
        }
        for (int index = 0; index < VSQuartersPerDay; ++index) {
            const int64_t start = dayStart + index * VSQuarterMicroseconds;
            if (start < segment.from || start >= segment.to) twice &= ~VSQuarterBit(index);
            if (isLongConflict(start)) metByLongSpans |= VSQuarterBit(index);
        }
        // The samples of quarters that long spans meet are asked for anyway.
        const VSQuarterBits missing = gatherMergedDay(dayStart, twice & ~metByLongSpans, merged);
        for (int index = 0; index < VSQuartersPerDay; ++index) {
            const int64_t start = dayStart + index * VSQuarterMicroseconds;
            if (missing & VSQuarterBit(index))
                conflicts.push_back({start, start + VSQuarterMicroseconds, false});
        }
    }
    const VSQuarterBits answeredElsewhere = twice | metByLongSpans;
    for (const RollupCursor* cursor : cursors) {
        VSForEachRollupQuarter(cursor->quarters(), [&](int index, const VSRollupQuarter& quarter) {
            const int64_t start = dayStart + index * VSQuarterMicroseconds;
            if (start < segment.from || start >= segment.to) return;
            const size_t bucket = bucketOf(start);
            Gathered& gathered = gathered_[bucket];
            if (quarter.starting)
                gathered.addStarting(quarter.starting, quarter.startingSum, quarter.minimum, quarter.maximum);
            if (!(answeredElsewhere & VSQuarterBit(index))) gathered.addShare(quarter.share);
            if (!separate_) return;
            Gathered& own = ofSource_[bucket][cursor->rank];
            if (quarter.starting)
                own.addStarting(quarter.starting, quarter.startingSum, quarter.minimum, quarter.maximum);
            own.addShare(quarter.share);
        });
    }
}

/// Adds what the merged row of a day has of the wanted quarters; returns those that it lacks.
VSQuarterBits VSStatisticsEngine::gatherMergedDay(int64_t dayStart, VSQuarterBits wanted,
                                                  const RollupCursor& merged) {
    if (!wanted || !merged.valid || merged.day() * VSDayMicroseconds != dayStart) return wanted;
    VSForEachQuarter<VSMergedQuarter>(merged.quarters(), [&](int index, const VSMergedQuarter& quarter) {
        if (!(wanted & VSQuarterBit(index))) return;
        gathered_[bucketOf(dayStart + index * VSQuarterMicroseconds)].addShare(quarter.share);
        wanted &= ~VSQuarterBit(index);
    });
    return wanted;
}

/// Spans over 48 hours, which no rollup holds.
void VSStatisticsEngine::gatherLongSpans(const Segment& segment, std::vector<Segment>& conflicts) {
    auto rows = reader_.database().use("SELECT " VS_SAMPLE_COLUMNS
                                       " FROM samples INDEXED BY samples_long WHERE type = ? AND start < ?"
                                       " AND duration > " VS_LONG_SPAN_SQL);
    rows.bind(1, VSTypeCodeValue(type_->code())).bind(2, segment.to);
    while (rows.step()) {
        const VSSampleRow row = VSReadSampleRow(rows);
        if (row.end() <= segment.from) continue;
        const size_t rank = rankOf(row.provenance);
        if (row.start >= segment.from) addStarting(row, rank);
        const int64_t from = std::max(row.start, segment.from), to = std::min(row.end(), segment.to);
        addShare({row.start, row.duration, row.value, rank}, from, to, merging_ ? Own : Own | Merged);
        if (merging_)
            conflicts.push_back({VSFloorDivide(from, VSQuarterMicroseconds) * VSQuarterMicroseconds,
                                 VSCeilingDivide(to, VSQuarterMicroseconds) * VSQuarterMicroseconds, false});
    }
    longConflicts_ = conflicts = united(std::move(conflicts));
}

bool VSStatisticsEngine::isLongConflict(int64_t moment) const {
    const auto next = std::upper_bound(longConflicts_.begin(), longConflicts_.end(), moment,
                                       [](int64_t value, const Segment& span) { return value < span.from; });
    return next != longConflicts_.begin() && moment < std::prev(next)->to;
}

void VSStatisticsEngine::gatherSamples(const Segment& segment, int parts) {
    VSPredicate predicate = predicate_;
    predicate.startDate = VSDate::fromMicroseconds(segment.from);
    predicate.endDate = VSDate::fromMicroseconds(segment.to);
    if (fromRollups_) predicate.dateOptions = VSQueryOptionNone;
    std::vector<VSRankedSpan> merged;
    const int shareParts = parts & (merging_ ? Own : Own | Merged);
    reader_.scan(type_, predicate, true, [&](const VSSampleRow& row) {
        const size_t rank = rankOf(row.provenance);
        const VSRankedSpan span{row.start, row.duration, row.value, rank};
        if ((parts & Starting) && row.start >= segment.from && row.start < segment.to) addStarting(row, rank);
        if (shareParts)
            addShare(span, std::max(row.start, segment.from),
                     row.duration ? std::min(row.end(), segment.to) : row.start, shareParts);
        if (merging_ && (parts & Merged)) merged.push_back(span);
        return true;
    });
    if (merged.empty()) return;
    VSForEachCountedPart(
        merged, segment.from, segment.to,
        [&](const VSRankedSpan& span, int64_t from, int64_t to) { addShare(span, from, to, Merged); });
}

void VSStatisticsEngine::addStarting(const VSSampleRow& row, size_t rank) {
    const size_t bucket = bucketOf(row.start);
    const VSExactSum value(row.value);
    gathered_[bucket].addStarting(1, value, row.value, row.value);
    if (separate_) ofSource_[bucket][rank].addStarting(1, value, row.value, row.value);
}

void VSStatisticsEngine::addShare(const VSRankedSpan& span, int64_t from, int64_t to, int parts) {
    size_t bucket = bucketOf(from);
    std::optional<VSExactSpan> exact;
    do {
        const int64_t end = std::min(to, borders_[bucket + 1]);
        const bool isWhole = from == span.start && end == span.end();
        if (!isWhole && !exact) exact.emplace(span.value, span.duration);
        const VSExactSum share =
            isWhole ? VSExactSum(span.value) : exact->part(from - span.start, end - span.start);
        if (parts & Merged) gathered_[bucket].addShare(share);
        if ((parts & Own) && separate_) ofSource_[bucket][span.rank].addShare(share);
        from = end;
        ++bucket;
    } while (from < to);
}

size_t VSStatisticsEngine::bucketOf(int64_t moment) {
    if (moment >= borders_[recentBucket_] && moment < borders_[recentBucket_ + 1]) return recentBucket_;
    const auto next = std::upper_bound(borders_.begin(), borders_.end(), moment);
    // The rollups' quarters of the first bucket may begin a little before it where there is no data.
    const auto index = std::max<ptrdiff_t>(next - borders_.begin(), 1) - 1;
    return recentBucket_ = std::min(static_cast<size_t>(index), gathered_.size() - 1);
}

size_t VSStatisticsEngine::rankOf(int64_t provenance) {
    const int64_t source = reader_.provenances().sourceOfProvenance(provenance);
    const auto found = std::find(sources_.begin(), sources_.end(), source);
    if (found == sources_.end())
        throw VSDatabaseFailure({VSErrorCode::Corrupt, "the store lacks a summary of a source"});
    return static_cast<size_t>(found - sources_.begin());
}

VSStatistics VSStatisticsEngine::finished(size_t bucket) const {
    const auto fill = [&](auto& target, const Gathered& gathered) {
        target.count = gathered.count;
        if (gathered.touched && (options_ & VSStatisticsOptionCumulativeSum))
            target.sum = gathered.sum.value();
        if (!gathered.count) return;
        if (options_ & VSStatisticsOptionDiscreteAverage)
            target.average = gathered.startingSum.dividedBy(static_cast<uint64_t>(gathered.count));
        if (options_ & VSStatisticsOptionDiscreteMin) target.minimum = gathered.minimum;
        if (options_ & VSStatisticsOptionDiscreteMax) target.maximum = gathered.maximum;
    };
    VSStatistics statistics;
    statistics.type = type_;
    statistics.startDate = VSDate::fromMicroseconds(borders_[bucket]);
    statistics.endDate = VSDate::fromMicroseconds(borders_[bucket + 1]);
    fill(statistics, gathered_[bucket]);
    if (!separate_ || ofSource_.empty()) return statistics;
    for (size_t rank = 0; rank < sources_.size(); ++rank) {
        const Gathered& own = ofSource_[bucket][rank];
        if (own.touched || own.count)
            fill(statistics.bySource[reader_.provenances().source(sources_[rank])], own);
    }
    return statistics;
}
