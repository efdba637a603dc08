#include "Vessa/VSRollup.h"

#include <algorithm>
#include <bit>

#include "Vessa/VSStoreProvenances.h"
#include "Vessa/VSStoreSchema.h"

static_assert(std::endian::native == std::endian::little, "the rollups on disk are little-endian");

namespace {

constexpr size_t entriesKept = 1024;  // 4 MB
constexpr int dayBits = 28, sourceBits = 20;
constexpr int64_t dayOffset = int64_t{1} << (dayBits - 1);

struct Quarters {
    int64_t first, last;
};  // counted from 1970, both included

Quarters quartersOf(int64_t start, int64_t duration) {
    const int64_t first = VSFloorDivide(start, VSQuarterMicroseconds);
    return {first, duration == 0 ? first : VSFloorDivide(start + duration - 1, VSQuarterMicroseconds)};
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

// VSDayRollup

bool VSDayRollup::isEmpty() const {
    return std::all_of(quarters.begin(), quarters.end(),
                       [](const VSRollupQuarter& q) { return q.touching == 0; });
}

void VSDayRollup::add(int64_t day, int64_t start, int64_t duration, double value) {
    if (duration > VSStoreSchema::longSpan.count()) return;
    const auto [first, last] = quartersOf(start, duration);
    const int64_t dayStart = day * VSQuartersPerDay;
    const int64_t from = std::max(first, dayStart), to = std::min(last, dayStart + VSQuartersPerDay - 1);
    for (int64_t index = from; index <= to; ++index) {
        VSRollupQuarter& quarter = quarters[static_cast<size_t>(index - dayStart)];
        ++quarter.touching;
        if (first == last) {
            quarter.share += value;
        } else {
            const int64_t begin = std::max(start, index * VSQuarterMicroseconds);
            const int64_t end = std::min(start + duration, (index + 1) * VSQuarterMicroseconds);
            quarter.share += value * (static_cast<double>(end - begin) / static_cast<double>(duration));
        }
        if (index != first) continue;
        quarter.minimum = quarter.starting ? std::min(quarter.minimum, value) : value;
        quarter.maximum = quarter.starting ? std::max(quarter.maximum, value) : value;
        ++quarter.starting;
        quarter.startingSum += value;
    }
}

std::string VSDayRollup::encoded() const {
    std::string bytes(VSQuartersPerDay / 8, '\0');
    for (size_t index = 0; index < quarters.size(); ++index) {
        if (quarters[index].touching == 0) continue;
        bytes[index / 8] = static_cast<char>(bytes[index / 8] | 1 << (index % 8));
        bytes.append(reinterpret_cast<const char*>(&quarters[index]), sizeof(VSRollupQuarter));
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

void VSRollupWriter::add(int type, int64_t source, int64_t start, int64_t duration, double value) {
    if (duration > VSStoreSchema::longSpan.count()) return;
    const auto [first, last] = quartersOf(start, duration);
    for (int64_t day = VSFloorDivide(first, VSQuartersPerDay); day <= VSFloorDivide(last, VSQuartersPerDay);
         ++day) {
        entry(VSRollupSlot(type, source, day)).rollup.add(day, start, duration, value);
    }
}

void VSRollupWriter::rebuild(int type, int64_t source, int64_t start, int64_t duration) {
    if (duration > VSStoreSchema::longSpan.count()) return;
    const auto [first, last] = quartersOf(start, duration);
    for (int64_t day = VSFloorDivide(first, VSQuartersPerDay); day <= VSFloorDivide(last, VSQuartersPerDay);
         ++day) {
        rebuild_.insert(VSRollupSlot(type, source, day));
    }
}

void VSRollupWriter::write(int64_t slot, const VSDayRollup& rollup) {
    if (rollup.isEmpty()) {
        database_.use("DELETE FROM rollups WHERE slot = ?").bind(1, slot).run();
        return;
    }
    const std::string bytes = rollup.encoded();
    database_
        .use(
            "INSERT INTO rollups(slot, quarters) VALUES (?1, ?2) ON CONFLICT(slot) DO UPDATE SET quarters = "
            "?2")
        .bind(1, slot)
        .bindBlob(2, bytes.data(), bytes.size())
        .run();
}

void VSRollupWriter::writeEntries() {
    for (const auto& [slot, entry] : entries_) write(slot, entry->rollup);
    entries_.clear();
    lastEntry_ = nullptr;
}

void VSRollupWriter::flush(VSStoreProvenances& provenances) {
    writeEntries();
    for (int64_t slot : rebuild_) {
        write(slot, VSRollupFromSamples(database_, provenances, VSRollupTypeOfSlot(slot),
                                        VSRollupSourceOfSlot(slot), VSRollupDayOfSlot(slot)));
    }
    rebuild_.clear();
}

void VSRollupWriter::clear() {
    entries_.clear();
    lastEntry_ = nullptr;
    rebuild_.clear();
}

VSDayRollup VSRollupFromSamples(VSDatabase& database, VSStoreProvenances& provenances, int type,
                                int64_t source, int64_t day) {
    struct Row {
        int64_t id, start, duration;
        double value;
    };
    std::vector<Row> rows;
    auto statement = database.use(
        "SELECT id, start, duration, value, provenance FROM samples WHERE type = ?1 AND start >= ?2 AND "
        "start < ?3"
        " AND start + duration >= ?4 AND duration <= " VS_LONG_SPAN_SQL);
    const int64_t dayStart = day * VSDayMicroseconds;
    auto longest = database.use("SELECT longest FROM types WHERE type = ?");
    const int64_t back = longest.bind(1, type).step() ? longest.integer(0) : VSStoreSchema::longSpan.count();
    statement.bind(1, type).bind(2, dayStart - back).bind(3, dayStart + VSDayMicroseconds).bind(4, dayStart);
    while (statement.step()) {
        if (provenances.sourceOfProvenance(statement.integer(4)) != source) continue;
        rows.push_back({statement.integer(0), statement.integer(1), statement.integer(2), statement.real(3)});
    }
    // In the order of insertion, as they were added one by one: floating-point sums depend on it.
    std::sort(rows.begin(), rows.end(), [](const Row& a, const Row& b) { return a.id < b.id; });
    VSDayRollup rollup;
    for (const Row& row : rows) rollup.add(day, row.start, row.duration, row.value);
    return rollup;
}
