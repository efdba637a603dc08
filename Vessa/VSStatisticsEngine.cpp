#include "Vessa/VSStatisticsEngine.h"

#include <algorithm>

#include "Vessa/VSRollup.h"
#include "Vessa/VSStoreSchema.h"

namespace {

/// Beyond this many partial quarters one pass over the samples is cheaper than rollups with a look at each.
constexpr size_t partialSegmentsAtMost = 16;

}  // namespace

void VSStatisticsEngine::Gathered::addStarting(int64_t samples, double total, double low, double high) {
    minimum = count ? std::min(minimum, low) : low;
    maximum = count ? std::max(maximum, high) : high;
    count += samples;
    startingSum += total;
}

void VSStatisticsEngine::Gathered::addShare(double share) {
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
    int64_t day() const { return VSRollupDayOfSlot(rows_.integer(0)); }
    std::string_view quarters() const { return rows_.blob(1); }

    const size_t rank;
    bool valid = false;

 private:
    VSStatement rows_;
};

/// Moments that samples of earlier sources cover, as separate spans in ascending order.
class VSStatisticsEngine::Cover {
 public:
    bool contains(int64_t moment) const {
        const auto next = after(moment);
        return next != spans_.begin() && moment < std::prev(next)->second;
    }
    /// Calls block(from, to) for each part of [from, to) that is not covered.
    template <typename Block>
    void forEachGap(int64_t from, int64_t to, Block block) const {
        auto next = after(from);
        if (next != spans_.begin()) from = std::max(from, std::prev(next)->second);
        for (; next != spans_.end() && next->first < to; ++next) {
            if (from < next->first) block(from, next->first);
            from = std::max(from, next->second);
        }
        if (from < to) block(from, to);
    }
    void add(std::vector<std::pair<int64_t, int64_t>> spans) {
        spans_.insert(spans_.end(), spans.begin(), spans.end());
        std::sort(spans_.begin(), spans_.end());
        size_t kept = 0;
        for (const auto& span : spans_) {
            if (kept && span.first <= spans_[kept - 1].second)
                spans_[kept - 1].second = std::max(spans_[kept - 1].second, span.second);
            else
                spans_[kept++] = span;
        }
        spans_.resize(kept);
    }

 private:
    std::vector<std::pair<int64_t, int64_t>>::const_iterator after(int64_t moment) const {
        return std::upper_bound(spans_.begin(), spans_.end(), moment,
                                [](int64_t value, const auto& span) { return value < span.first; });
    }
    std::vector<std::pair<int64_t, int64_t>> spans_;
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
    const auto extent = reader_.extent(type_);
    if (!extent.count) return false;
    from_ = extent.firstStart;
    to_ = extent.lastEnd + 1;  // a sample without length lies at its end
    if (predicate_.startDate) from_ = std::max(from_, predicate_.startDate->microseconds());
    if (predicate_.endDate) to_ = std::min(to_, predicate_.endDate->microseconds());
    merging_ = sources_.size() > 1 && type_->isCumulative() && (options_ & VSStatisticsOptionCumulativeSum);
    return from_ < to_;
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
    std::vector<VSStatistics> result;
    if (!findRange()) return result;
    std::vector<int64_t> borders;
    for (VSDate border : calendar.bucketBoundaries(anchor, interval, VSDate::fromMicroseconds(from_),
                                                   VSDate::fromMicroseconds(to_)))
        borders.push_back(border.microseconds());
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
        gatherDay(day, today, segment, conflicts);
        for (RollupCursor* cursor : today) cursor->next();
    }
    cursors.clear();
    std::sort(conflicts.begin(), conflicts.end(),
              [](const Segment& a, const Segment& b) { return a.from < b.from; });
    Segment pending{INT64_MIN, INT64_MIN, false};
    for (const Segment& conflict : conflicts) {
        if (conflict.from > pending.to) {
            if (pending.from < pending.to) gatherSamples(pending, Merged);
            pending = conflict;
        }
        pending.to = std::max(pending.to, conflict.to);
    }
    if (pending.from < pending.to) gatherSamples(pending, Merged);
}

void VSStatisticsEngine::gatherDay(int64_t day, std::vector<RollupCursor*>& cursors, const Segment& segment,
                                   std::vector<Segment>& conflicts) {
    const int64_t dayStart = day * VSDayMicroseconds;
    std::array<uint8_t, VSQuartersPerDay> sourcesIn{};
    if (merging_) {
        if (cursors.size() > 1) {
            for (RollupCursor* cursor : cursors)
                VSForEachRollupQuarter(cursor->quarters(), [&](int index, const VSRollupQuarter&) {
                    uint8_t& count = sourcesIn[static_cast<size_t>(index)];
                    count = static_cast<uint8_t>(std::min(count + 1, 2));
                });
        }
        // The first conflicts of the list are long spans: theirs are all quarters that they meet.
        const size_t longSpans = conflicts.size();
        for (int index = 0; index < VSQuartersPerDay; ++index) {
            uint8_t& count = sourcesIn[static_cast<size_t>(index)];
            const int64_t start = dayStart + index * VSQuarterMicroseconds;
            if (start < segment.from || start >= segment.to) continue;
            if (count > 1) {
                if (conflicts.size() > longSpans && conflicts.back().to == start)
                    conflicts.back().to += VSQuarterMicroseconds;
                else
                    conflicts.push_back({start, start + VSQuarterMicroseconds, false});
            }
        }
    }
    for (RollupCursor* cursor : cursors) {
        VSForEachRollupQuarter(cursor->quarters(), [&](int index, const VSRollupQuarter& quarter) {
            const int64_t start = dayStart + index * VSQuarterMicroseconds;
            if (start < segment.from || start >= segment.to) return;
            const size_t bucket = bucketOf(start);
            Gathered& gathered = gathered_[bucket];
            if (quarter.starting)
                gathered.addStarting(quarter.starting, quarter.startingSum, quarter.minimum, quarter.maximum);
            if (!merging_ || (sourcesIn[static_cast<size_t>(index)] < 2 && !isLongConflict(start)))
                gathered.addShare(quarter.share);
            if (!separate_) return;
            Gathered& own = ofSource_[bucket][cursor->rank];
            if (quarter.starting)
                own.addStarting(quarter.starting, quarter.startingSum, quarter.minimum, quarter.maximum);
            own.addShare(quarter.share);
        });
    }
}

/// Spans over 48 hours, which no rollup holds.
void VSStatisticsEngine::gatherLongSpans(const Segment& segment, std::vector<Segment>& conflicts) {
    auto rows = reader_.database().use("SELECT " VS_SAMPLE_COLUMNS
                                       " FROM samples INDEXED BY samples_long WHERE type = ? AND start < ?"
                                       " AND duration > " VS_LONG_SPAN_SQL);
    rows.bind(1, VSTypeCodeValue(type_->code())).bind(2, segment.to);
    longConflicts_.clear();
    while (rows.step()) {
        const VSSampleRow row = VSReadSampleRow(rows);
        if (row.end() <= segment.from) continue;
        const size_t rank = rankOf(row.provenance);
        if (row.start >= segment.from) addStarting(row.start, rank, 1, row.value, row.value, row.value);
        const int64_t from = std::max(row.start, segment.from), to = std::min(row.end(), segment.to);
        addShare(from, to, row.duration, row.value, rank, merging_ ? Own : Own | Merged);
        if (merging_) {
            const Segment met{VSFloorDivide(from, VSQuarterMicroseconds) * VSQuarterMicroseconds,
                              VSCeilingDivide(to, VSQuarterMicroseconds) * VSQuarterMicroseconds, false};
            conflicts.push_back(met);
            longConflicts_.push_back(met);
        }
    }
}

bool VSStatisticsEngine::isLongConflict(int64_t moment) const {
    return std::any_of(longConflicts_.begin(), longConflicts_.end(),
                       [&](const Segment& span) { return moment >= span.from && moment < span.to; });
}

void VSStatisticsEngine::gatherSamples(const Segment& segment, int parts) {
    VSPredicate predicate = predicate_;
    predicate.startDate = VSDate::fromMicroseconds(segment.from);
    predicate.endDate = VSDate::fromMicroseconds(segment.to);
    if (fromRollups_) predicate.dateOptions = VSQueryOptionNone;
    std::vector<RankedRow> merged;
    const int shareParts = parts & (merging_ ? Own : Own | Merged);
    reader_.scan(type_, predicate, true, [&](const VSSampleRow& row) {
        const size_t rank = rankOf(row.provenance);
        if ((parts & Starting) && row.start >= segment.from && row.start < segment.to)
            addStarting(row.start, rank, 1, row.value, row.value, row.value);
        if (shareParts) {
            if (row.duration == 0)
                addShare(row.start, row.start, 0, row.value, rank, shareParts);
            else
                addShare(std::max(row.start, segment.from), std::min(row.end(), segment.to), row.duration,
                         row.value, rank, shareParts);
        }
        if (merging_ && (parts & Merged)) merged.push_back({rank, row});
        return true;
    });
    if (!merged.empty()) gatherMerged(merged, segment);
}

void VSStatisticsEngine::gatherMerged(const std::vector<RankedRow>& rows, const Segment& segment) {
    std::vector<size_t> order(rows.size());
    for (size_t index = 0; index < order.size(); ++index) order[index] = index;
    std::stable_sort(order.begin(), order.end(),
                     [&](size_t a, size_t b) { return rows[a].rank < rows[b].rank; });
    Cover cover;
    std::vector<std::pair<int64_t, int64_t>> ofThisSource;
    for (size_t place = 0; place < order.size(); ++place) {
        const auto& [rank, row] = rows[order[place]];
        if (place && rank != rows[order[place - 1]].rank) {
            cover.add(std::exchange(ofThisSource, {}));
        }
        if (row.duration == 0) {
            if (!cover.contains(row.start)) addShare(row.start, row.start, 0, row.value, rank, Merged);
            continue;
        }
        const int64_t from = std::max(row.start, segment.from), to = std::min(row.end(), segment.to);
        cover.forEachGap(
            from, to, [&](int64_t a, int64_t b) { addShare(a, b, row.duration, row.value, rank, Merged); });
        ofThisSource.emplace_back(from, to);
    }
}

void VSStatisticsEngine::addStarting(int64_t moment, size_t rank, int64_t count, double sum, double low,
                                     double high) {
    const size_t bucket = bucketOf(moment);
    gathered_[bucket].addStarting(count, sum, low, high);
    if (separate_) ofSource_[bucket][rank].addStarting(count, sum, low, high);
}

void VSStatisticsEngine::addShare(int64_t from, int64_t to, int64_t duration, double value, size_t rank,
                                  int parts) {
    size_t bucket = bucketOf(from);
    do {
        const int64_t end = std::min(to, borders_[bucket + 1]);
        const double share =
            duration == 0 ? value : value * (static_cast<double>(end - from) / static_cast<double>(duration));
        if (parts & Merged) gathered_[bucket].addShare(share);
        if ((parts & Own) && separate_) ofSource_[bucket][rank].addShare(share);
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
        if (gathered.touched && (options_ & VSStatisticsOptionCumulativeSum)) target.sum = gathered.sum;
        if (!gathered.count) return;
        if (options_ & VSStatisticsOptionDiscreteAverage)
            target.average = gathered.startingSum / static_cast<double>(gathered.count);
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
