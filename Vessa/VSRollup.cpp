#include "Vessa/VSRollup.h"

#include <algorithm>
#include <bit>
#include <cstring>
#include <optional>

#include "Vessa/VSStoreProvenances.h"
#include "Vessa/VSStoreSchema.h"

static_assert(std::endian::native == std::endian::little, "the rollups on disk are little-endian");

namespace {

constexpr size_t entriesKept = 512;  // 4 MB
/// Reading on is faster than finding the next place.
constexpr int64_t daysReadForNothing = 2;
constexpr int dayBits = 28, sourceBits = 20;
constexpr int64_t dayOffset = int64_t{1} << (dayBits - 1);
constexpr size_t bitmapSize = VSQuartersPerDay / 8;

// The first byte of a quarter on disk: what follows, and what follows from it.
enum Form : unsigned {
    Starts = 1,             // samples start in it
    AllStart = 2,           // as many as touch it
    ShareIsSum = 4,         // the share equals the sum of those that start
    OneValue = 8,           // the greatest value is the least
    CountsOfTwoBytes = 16,  // else of one
    CountsOfFourBytes = 32
};

template <typename Number>
void append(std::string& bytes, Number number, size_t size = sizeof(Number)) {
    bytes.append(reinterpret_cast<const char*>(&number), size);
}

/// Reads an unsigned number of so many bytes, 8 at most.
uint64_t take(const char*& next, const char* end, size_t size) {
    uint64_t number = 0;
    if (end - next >= 8) {  // a load of fixed size, which is fast
        std::memcpy(&number, next, 8);
        number = size < 8 ? number & ((uint64_t{1} << (8 * size)) - 1) : number;
    } else {
        if (end - next < static_cast<ptrdiff_t>(size)) VSThrowCorruptRollup();
        std::memcpy(&number, next, size);
    }
    next += size;
    return number;
}

/// How many bytes of a double are kept: those at the lower end that are 0 are not.
size_t bytesOf(double number) {
    const auto bits = std::bit_cast<uint64_t>(number);
    return bits ? 8 - static_cast<size_t>(std::countr_zero(bits)) / 8 : 0;
}

void appendDouble(std::string& bytes, double number, size_t size) {
    bytes.append(reinterpret_cast<const char*>(&number) + (8 - size), size);
}

double takeDouble(const char*& next, const char* end, size_t size) {
    if (size == 0) return 0;
    if (size > 8) VSThrowCorruptRollup();
    return std::bit_cast<double>(take(next, end, size) << (64 - 8 * size));
}

}  // namespace

void VSThrowCorruptRollup() {
    throw VSDatabaseFailure({VSErrorCode::Corrupt, "a rollup of the store is damaged"});
}

int64_t VSRollupSlot(int type, int64_t source, int64_t day) {
    return (int64_t{type} << sourceBits | source) << dayBits | (day + dayOffset);
}
int64_t VSRollupDayOfSlot(int64_t slot) {
    return (slot & ((int64_t{1} << dayBits) - 1)) - dayOffset;
}
int64_t VSRollupSourceOfSlot(int64_t slot) {
    return slot >> dayBits & ((int64_t{1} << sourceBits) - 1);
}
int VSRollupTypeOfSlot(int64_t slot) {
    return static_cast<int>(slot >> (dayBits + sourceBits));
}

VSQuarterRange VSQuartersOfSpan(int64_t start, int64_t duration) {
    const int64_t first = VSFloorDivide(start, VSQuarterMicroseconds);
    return {first, duration == 0 ? first : VSFloorDivide(start + duration - 1, VSQuarterMicroseconds)};
}

VSQuarterBits VSQuartersPresent(std::string_view bytes) {
    if (bytes.size() < bitmapSize) VSThrowCorruptRollup();
    VSQuarterBits bits = 0;
    std::memcpy(&bits, bytes.data(), bitmapSize);
    return bits;
}

void VSAppendQuarterBits(VSQuarterBits bits, std::string& bytes) {
    append(bytes, bits, bitmapSize);
}

// VSRollupQuarter

void VSRollupQuarter::appendTo(std::string& bytes) const {
    unsigned form = 0;
    if (starting) form |= Starts;
    if (starting == touching) form |= AllStart;
    if (share == startingSum) form |= ShareIsSum;
    if (std::bit_cast<uint64_t>(minimum) == std::bit_cast<uint64_t>(maximum)) form |= OneValue;
    if (touching > UINT16_MAX)
        form |= CountsOfFourBytes;
    else if (touching > UINT8_MAX)
        form |= CountsOfTwoBytes;
    const size_t countSize = form & CountsOfFourBytes ? 4 : form & CountsOfTwoBytes ? 2 : 1;
    append(bytes, static_cast<uint8_t>(form));
    append(bytes, touching, countSize);
    if (form & Starts) {
        if (!(form & AllStart)) append(bytes, starting, countSize);
        startingSum.appendTo(bytes);
        const size_t ofMinimum = bytesOf(minimum), ofMaximum = form & OneValue ? 0 : bytesOf(maximum);
        append(bytes, static_cast<uint8_t>(ofMinimum | ofMaximum << 4));
        appendDouble(bytes, minimum, ofMinimum);
        appendDouble(bytes, maximum, ofMaximum);
    }
    if (!(form & ShareIsSum)) share.appendTo(bytes);
}

void VSRollupQuarter::readFrom(const char*& next, const char* end) {
    const auto form = take(next, end, 1);
    const size_t countSize = form & CountsOfFourBytes ? 4 : form & CountsOfTwoBytes ? 2 : 1;
    touching = static_cast<uint32_t>(take(next, end, countSize));
    if (form & Starts) {
        starting = form & AllStart ? touching : static_cast<uint32_t>(take(next, end, countSize));
        if (!startingSum.readFrom(next, end)) VSThrowCorruptRollup();
        const auto sizes = take(next, end, 1);
        minimum = takeDouble(next, end, sizes & 15);
        maximum = takeDouble(next, end, sizes >> 4);
        if (form & OneValue) maximum = minimum;
    }
    if (form & ShareIsSum)
        share = startingSum;
    else if (!share.readFrom(next, end))
        VSThrowCorruptRollup();
}

// VSDayRollup

bool VSDayRollup::isEmpty() const {
    return std::all_of(quarters.begin(), quarters.end(),
                       [](const VSRollupQuarter& q) { return q.touching == 0; });
}

void VSDayRollup::add(int64_t day, int64_t start, int64_t duration, double value) {
    if (duration > VSStoreSchema::longSpan.count()) return;
    const auto [first, last] = VSQuartersOfSpan(start, duration);
    const int64_t dayStart = day * VSQuartersPerDay;
    const int64_t from = std::max(first, dayStart), to = std::min(last, dayStart + VSQuartersPerDay - 1);
    std::optional<VSExactSpan> span;
    if (first != last) span.emplace(value, duration);
    for (int64_t index = from; index <= to; ++index) {
        VSRollupQuarter& quarter = quarters[static_cast<size_t>(index - dayStart)];
        ++quarter.touching;
        quarter.share += span ? span->part(std::max<int64_t>(index * VSQuarterMicroseconds - start, 0),
                                           std::min((index + 1) * VSQuarterMicroseconds - start, duration))
                              : VSExactSum(value);
        if (index != first) continue;
        const double plain = value + 0.0;  // no minus zero: it would depend on the order
        quarter.minimum = quarter.starting ? std::min(quarter.minimum, plain) : plain;
        quarter.maximum = quarter.starting ? std::max(quarter.maximum, plain) : plain;
        ++quarter.starting;
        quarter.startingSum += VSExactSum(value);
    }
}

std::string VSDayRollup::encoded() const {
    VSQuarterBits present = 0;
    for (int index = 0; index < VSQuartersPerDay; ++index) {
        if (quarters[static_cast<size_t>(index)].touching) present |= VSQuarterBit(index);
    }
    std::string bytes;
    VSAppendQuarterBits(present, bytes);
    for (const VSRollupQuarter& quarter : quarters) {
        if (quarter.touching) quarter.appendTo(bytes);
    }
    return bytes;
}

VSDayRollup VSDayRollup::decoded(std::string_view bytes) {
    VSDayRollup rollup;
    VSForEachRollupQuarter(
        bytes, [&](int index, const VSRollupQuarter& q) { rollup.quarters[static_cast<size_t>(index)] = q; });
    return rollup;
}

// VSRollupWriter

VSRollupWriter::Entry& VSRollupWriter::entry(int64_t slot) {
    if (lastEntry_ && lastSlot_ == slot) return *lastEntry_;
    auto found = entries_.find(slot);
    if (found == entries_.end()) {
        if (entries_.size() >= entriesKept) writeEntries();
        auto made = std::make_unique<Entry>();
        auto row = database_.use("SELECT quarters FROM rollups WHERE slot = ?");
        row.bind(1, slot);
        if (row.step()) made->rollup = VSDayRollup::decoded(row.blob(0));
        found = entries_.emplace(slot, std::move(made)).first;
    }
    lastSlot_ = slot;
    lastEntry_ = found->second.get();
    return *lastEntry_;
}

/// Calls block(day, first quarter, last quarter) for each day that a span touches.
template <typename Block>
static void forEachDay(int64_t start, int64_t duration, Block block) {
    const auto [first, last] = VSQuartersOfSpan(start, duration);
    for (int64_t day = VSFloorDivide(first, VSQuartersPerDay); day <= VSFloorDivide(last, VSQuartersPerDay);
         ++day) {
        const int64_t dayStart = day * VSQuartersPerDay;
        block(day, static_cast<int>(std::max<int64_t>(first - dayStart, 0)),
              static_cast<int>(std::min<int64_t>(last - dayStart, VSQuartersPerDay - 1)));
    }
}

void VSRollupWriter::add(int type, int64_t source, int64_t start, int64_t duration, double value) {
    if (duration > VSStoreSchema::longSpan.count()) return;
    forEachDay(start, duration, [&](int64_t day, int first, int last) {
        Entry& changing = entry(VSRollupSlot(type, source, day));
        changing.rollup.add(day, start, duration, value);
        changing.changed.include(first, last);
    });
}

void VSRollupWriter::rebuild(int type, int64_t source, int64_t start, int64_t duration) {
    if (duration > VSStoreSchema::longSpan.count()) return;
    forEachDay(start, duration, [&](int64_t day, int first, int last) {
        const Place place{type, day, source};
        if (!recentRebuild_ || recentPlace_ != place) {
            recentRebuild_ = &rebuild_[place];
            recentPlace_ = place;
        }
        recentRebuild_->include(first, last);
    });
}

void VSRollupWriter::write(int64_t slot, const VSDayRollup& rollup) {
    VSWriteRollupRow(database_, slot, rollup.isEmpty() ? std::string() : rollup.encoded());
}

void VSRollupWriter::note(int64_t slot, const Changed& changed) {
    changes_[{VSRollupTypeOfSlot(slot), VSRollupDayOfSlot(slot)}].include(changed.first, changed.last);
}

void VSRollupWriter::writeEntries() {
    for (const auto& [slot, entry] : entries_) {
        write(slot, entry->rollup);
        note(slot, entry->changed);
    }
    entries_.clear();
    lastEntry_ = nullptr;
}

void VSRollupWriter::flush(VSStoreProvenances& provenances) {
    writeEntries();
    for (auto first = rebuild_.cbegin(); first != rebuild_.cend();) {
        // Days close to each other are read in one go.
        auto last = first;
        for (int64_t day = first->first.day;
             last != rebuild_.cend() && last->first.type == first->first.type &&
             last->first.day <= day + daysReadForNothing;
             ++last)
            day = last->first.day;
        makeAnew(first, last, provenances);
        first = last;
    }
    rebuild_.clear();
    recentRebuild_ = nullptr;
}

/// Of one type, in one pass over the samples that touch the days from the first to the last.
void VSRollupWriter::makeAnew(Places::const_iterator first, Places::const_iterator last,
                              VSStoreProvenances& provenances) {
    const int type = first->first.type;
    std::map<Place, VSDayRollup> made;
    const auto writeDaysBefore = [&](int64_t day) {
        for (; first != last && first->first.day < day; ++first) {
            const int64_t slot = VSRollupSlot(type, first->first.source, first->first.day);
            const auto found = made.extract(first->first);
            write(slot, found ? found.mapped() : VSDayRollup());
            note(slot, first->second);
        }
    };
    auto longest = database_.use("SELECT longest FROM types WHERE type = ?");
    const int64_t back = longest.bind(1, type).step() ? longest.integer(0) : VSStoreSchema::longSpan.count();
    const int64_t begin = first->first.day * VSDayMicroseconds,
                  end = (std::prev(last)->first.day + 1) * VSDayMicroseconds;
    auto rows = database_.use(
        "SELECT start, duration, value, provenance FROM samples WHERE type = ?1 AND start >= ?2 AND start < "
        "?3 AND start + duration >= ?4 AND duration <= " VS_LONG_SPAN_SQL " ORDER BY start");
    rows.bind(1, type).bind(2, begin - back).bind(3, end).bind(4, begin);
    while (rows.step()) {
        const int64_t start = rows.integer(0), duration = rows.integer(1);
        writeDaysBefore(VSFloorDivide(start, VSDayMicroseconds));  // no sample that comes later touches them
        const int64_t source = provenances.sourceOfProvenance(rows.integer(3));
        forEachDay(start, duration, [&](int64_t day, int, int) {
            const Place place{type, day, source};
            if (rebuild_.contains(place)) made[place].add(day, start, duration, rows.real(2));
        });
    }
    writeDaysBefore(INT64_MAX);
}

void VSRollupWriter::clear() {
    entries_.clear();
    lastEntry_ = nullptr;
    rebuild_.clear();
    recentRebuild_ = nullptr;
    changes_.clear();
}

void VSWriteRollupRow(VSDatabase& database, int64_t slot, const std::string& bytes) {
    if (bytes.empty()) {
        database.use("DELETE FROM rollups WHERE slot = ?").bind(1, slot).run();
        return;
    }
    database
        .use(
            "INSERT INTO rollups(slot, quarters) VALUES (?1, ?2) ON CONFLICT(slot) DO UPDATE SET quarters = "
            "?2")
        .bind(1, slot)
        .bindBlob(2, bytes.data(), bytes.size())
        .run();
}
