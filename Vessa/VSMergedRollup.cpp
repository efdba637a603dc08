#include "Vessa/VSMergedRollup.h"

#include <algorithm>

#include "Vessa/VSLimits.h"
#include "Vessa/VSObjectType.h"
#include "Vessa/VSStoreProvenances.h"
#include "Vessa/VSStoreSchema.h"

namespace {

/// So many days are made anew in one pass over their samples.
constexpr size_t daysAtOnce = 64;

}  // namespace

std::vector<int64_t> VSOrderedSources(VSDatabase& database, VSStoreProvenances& provenances, int type) {
    std::vector<int64_t> order;
    auto chosen = database.use(
        "SELECT source FROM source_order WHERE type = ?1 AND source IN (SELECT source FROM type_sources "
        "WHERE type = ?1) ORDER BY position");
    chosen.bind(1, type);
    while (chosen.step()) order.push_back(chosen.integer(0));
    // Also where none of the chosen ones has samples (any more).
    auto anyChosen = database.use("SELECT 1 FROM source_order WHERE type = ? LIMIT 1");
    const bool userChose = anyChosen.bind(1, type).step();
    std::vector<int64_t> others;
    auto rest = database.use("SELECT source FROM type_sources WHERE type = ? ORDER BY first_start, source");
    rest.bind(1, type);
    while (rest.step()) {
        if (std::find(order.begin(), order.end(), rest.integer(0)) == order.end())
            others.push_back(rest.integer(0));
    }
    if (!userChose)
        std::stable_partition(others.begin(), others.end(),
                              [&](int64_t id) { return provenances.source(id).isApplication(); });
    order.insert(order.end(), others.begin(), others.end());
    return order;
}

bool VSTypeIsMerged(int type) {
    const VSObjectType* known = VSObjectType::dataTypeWithCode(type);
    return known && known->isCumulative();
}

std::vector<int64_t> VSOrderOfMergedRows(VSDatabase& database, int type) {
    std::vector<int64_t> order;
    auto rows = database.use("SELECT source FROM merged_orders WHERE type = ? ORDER BY position");
    rows.bind(1, type);
    while (rows.step()) order.push_back(rows.integer(0));
    return order;
}

void VSNoteOrderOfMergedRows(VSDatabase& database, int type, const std::vector<int64_t>& order) {
    database.use("DELETE FROM merged_orders WHERE type = ?").bind(1, type).run();
    auto insert = database.use("INSERT INTO merged_orders(type, position, source) VALUES (?, ?, ?)");
    for (size_t position = 0; position < order.size(); ++position)
        insert.bind(1, type).bind(2, static_cast<int64_t>(position)).bind(3, order[position]).run();
}

bool VSOrdersAgree(const std::vector<int64_t>& a, const std::vector<int64_t>& b) {
    size_t place = 0;
    for (int64_t source : a) {
        const auto found = std::find(b.begin(), b.end(), source);
        if (found == b.end()) continue;
        const auto index = static_cast<size_t>(found - b.begin());
        if (index < place) return false;
        place = index;
    }
    return true;
}

// VSMergedDay

void VSMergedQuarter::readFrom(const char*& next, const char* end) {
    if (!share.readFrom(next, end)) VSThrowCorruptRollup();
}

void VSMergedDay::set(int index, const VSExactSum& share) {
    present_ |= VSQuarterBit(index);
    shares_[static_cast<size_t>(index)] = share;
}

void VSMergedDay::clear(int from, int to) {
    for (int index = from; index <= to; ++index) present_ &= ~VSQuarterBit(index);
}

std::string VSMergedDay::encoded() const {
    std::string bytes;
    if (!present_) return bytes;
    VSAppendQuarterBits(present_, bytes);
    for (int index = 0; index < VSQuartersPerDay; ++index) {
        if (present_ & VSQuarterBit(index)) shares_[static_cast<size_t>(index)].appendTo(bytes);
    }
    return bytes;
}

VSMergedDay VSMergedDay::decoded(std::string_view bytes) {
    VSMergedDay day;
    VSForEachQuarter<VSMergedQuarter>(
        bytes, [&](int index, const VSMergedQuarter& quarter) { day.set(index, quarter.share); });
    return day;
}

// VSMergedSweep

void VSMergedSweep::add(const VSRankedSpan& span) {
    if (span.duration > VSStoreSchema::longSpan.count()) return;
    advance(VSFloorDivide(span.start, VSQuarterMicroseconds));
    active_.push_back(span);
}

/// Ends the quarters before this one.
void VSMergedSweep::advance(int64_t quarter) {
    while (quarter_ < quarter && !active_.empty()) {
        merge();
        std::erase_if(active_, [this](const VSRankedSpan& span) {
            return VSQuartersOfSpan(span.start, span.duration).last <= quarter_;
        });
        ++quarter_;
    }
    if (active_.empty()) quarter_ = quarter;
}

void VSMergedSweep::merge() {
    const auto otherRank = [this](const VSRankedSpan& span) { return span.rank != active_.front().rank; };
    if (std::none_of(active_.begin(), active_.end(), otherRank)) return;
    sorted_ = active_;
    VSExactSum share;
    const int64_t begin = quarter_ * VSQuarterMicroseconds;
    VSForEachCountedPart(sorted_, begin, begin + VSQuarterMicroseconds,
                         [&](const VSRankedSpan& span, int64_t from, int64_t to) {
                             share +=
                                 VSShareOfSpan(span.value, span.duration, from - span.start, to - span.start);
                         });
    block_(quarter_, share);
}

// VSMergedRollups

void VSMergedRollups::update(int type, const std::map<int64_t, VSRollupWriter::Changed>& changes) {
    type_ = type;
    order_ = VSOrderedSources(database_, provenances_, type);
    const auto noted = VSOrderOfMergedRows(database_, type);
    if (!VSOrdersAgree(noted, order_)) {
        remakeAll();
    } else if (order_.size() > 1 || noted.size() > 1) {
        std::vector<Day> together;
        for (const auto& [day, changed] : changes) {
            const Day next{day, changed.first, changed.last};
            if (sourcesMeet(next)) {
                if (!together.empty() && (together.back().day + 1 != day || together.size() == daysAtOnce))
                    remake(std::exchange(together, {}));
                together.push_back(next);
                continue;
            }
            const int64_t slot = VSRollupSlot(type, VSMergedSource, day);
            auto row = database_.use("SELECT quarters FROM rollups WHERE slot = ?");
            if (!row.bind(1, slot).step()) continue;
            VSMergedDay merged = VSMergedDay::decoded(row.blob(0));
            merged.clear(next.first, next.last);
            VSWriteRollupRow(database_, slot, merged.encoded());
        }
        if (!together.empty()) remake(together);
    }
    if (noted != order_) VSNoteOrderOfMergedRows(database_, type, order_);
}

bool VSMergedRollups::sourcesMeet(const Day& day) {
    VSQuarterBits once = 0, twice = 0;
    auto row = database_.use("SELECT quarters FROM rollups WHERE slot = ?");
    for (int64_t source : order_) {
        row.bind(1, VSRollupSlot(type_, source, day.day));
        if (row.step()) {
            const VSQuarterBits present = VSQuartersPresent(row.blob(0));
            twice |= once & present;
            once |= present;
        }
        row.reset();
    }
    return twice >> day.first & (VSQuarterBit(day.last - day.first + 1) - 1);
}

/// Days that follow each other.
void VSMergedRollups::remake(const std::vector<Day>& days) {
    const int64_t firstDay = days.front().day;
    std::vector<VSMergedDay> made(days.size());
    for (size_t index = 0; index < days.size(); ++index) {
        auto row = database_.use("SELECT quarters FROM rollups WHERE slot = ?");
        if (row.bind(1, VSRollupSlot(type_, VSMergedSource, days[index].day)).step())
            made[index] = VSMergedDay::decoded(row.blob(0));
        made[index].clear(index == 0 ? days[index].first : 0,
                          index + 1 == days.size() ? days[index].last : VSQuartersPerDay - 1);
    }
    const int64_t first = firstDay * VSQuartersPerDay + days.front().first,
                  last = days.back().day * VSQuartersPerDay + days.back().last;
    VSMergedSweep merging([&](int64_t quarter, const VSExactSum& share) {
        if (quarter < first || quarter > last) return;
        const int64_t day = VSFloorDivide(quarter, VSQuartersPerDay);
        made[static_cast<size_t>(day - firstDay)].set(static_cast<int>(quarter - day * VSQuartersPerDay),
                                                      share);
    });
    sweep(first * VSQuarterMicroseconds, (last + 1) * VSQuarterMicroseconds, merging);
    for (size_t index = 0; index < days.size(); ++index)
        VSWriteRollupRow(database_, VSRollupSlot(type_, VSMergedSource, days[index].day),
                         made[index].encoded());
}

/// The samples that touch [from, to).
void VSMergedRollups::sweep(int64_t from, int64_t to, VSMergedSweep& sweep) {
    std::map<int64_t, size_t> ranks;
    for (size_t rank = 0; rank < order_.size(); ++rank) ranks[order_[rank]] = rank;
    auto longest = database_.use("SELECT longest FROM types WHERE type = ?");
    const int64_t back = longest.bind(1, type_).step() ? longest.integer(0) : VSStoreSchema::longSpan.count();
    auto rows = database_.use(
        "SELECT start, duration, value, provenance FROM samples WHERE type = ?1 AND start >= ?2 AND start < "
        "?3 "
        "AND start + duration >= ?4 AND duration <= " VS_LONG_SPAN_SQL " ORDER BY start, id");
    rows.bind(1, type_).bind(2, from - back).bind(3, to).bind(4, from);
    while (rows.step()) {
        const size_t rank = ranks.at(provenances_.sourceOfProvenance(rows.integer(3)));
        sweep.add({rows.integer(0), rows.integer(1), rows.real(2), rank});
    }
    sweep.finish();
}

void VSMergedRollups::remakeAll() {
    database_.use("DELETE FROM rollups WHERE slot BETWEEN ? AND ?")
        .bind(1, VSRollupSlot(type_, VSMergedSource, VSFloorDivide(INT64_MIN, VSDayMicroseconds)))
        .bind(2, VSRollupSlot(type_, VSMergedSource, VSFloorDivide(INT64_MAX, VSDayMicroseconds)))
        .run();
    int64_t day = INT64_MIN;
    VSMergedDay made;
    const auto write = [&] {
        if (day == INT64_MIN) return;
        VSWriteRollupRow(database_, VSRollupSlot(type_, VSMergedSource, day), made.encoded());
        made = {};
    };
    VSMergedSweep merging([&](int64_t quarter, const VSExactSum& share) {
        const int64_t its = VSFloorDivide(quarter, VSQuartersPerDay);
        if (its != day) write();
        day = its;
        made.set(static_cast<int>(quarter - day * VSQuartersPerDay), share);
    });
    sweep(VSLimits::earliestDate.microseconds(), VSLimits::latestDate.microseconds() + 1, merging);
    write();
}
