#pragma once

#include <array>
#include <cstdint>
#include <cstring>
#include <map>
#include <memory>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include "Vessa/VSDatabase.h"
#include "Vessa/VSObject.h"

class VSStoreProvenances;

inline constexpr int64_t VSQuarterMicroseconds = 900'000'000;
inline constexpr int VSQuartersPerDay = 96;
inline constexpr int64_t VSDayMicroseconds = VSQuarterMicroseconds * VSQuartersPerDay;

/// Division towards the past, for times before 1970 too.
constexpr int64_t VSFloorDivide(int64_t a, int64_t b) {
    return a / b - (a % b < 0 ? 1 : 0);
}
constexpr int64_t VSCeilingDivide(int64_t a, int64_t b) {
    return a / b + (a % b > 0 ? 1 : 0);
}

/// What one quarter of an hour holds of one type and source. The layout is that on disk (little-endian).
struct VSRollupQuarter {
    uint32_t starting = 0;   // samples that start in it
    uint32_t touching = 0;   // samples that have a part of their span, or their moment, in it
    double startingSum = 0;  // of the values of those that start in it
    double share = 0;        // of each span the part of its value that falls into it, in proportion to time
    double minimum = 0, maximum = 0;  // of those that start in it; 0 when none does

    friend bool operator==(const VSRollupQuarter&, const VSRollupQuarter&) = default;
};
static_assert(sizeof(VSRollupQuarter) == 40);

/// The quarters of one day (UTC) of one type and source.
struct VSDayRollup {
    std::array<VSRollupQuarter, VSQuartersPerDay> quarters;

    bool isEmpty() const;
    /// Adds what a sample leaves in this day. Spans over 48 hours leave nothing. `day` counts from 1970.
    void add(int64_t day, int64_t start, int64_t duration, double value);
    /// A bit per quarter that holds something (12 bytes), then those quarters.
    std::string encoded() const;
    /// Throws VSDatabaseFailure (Corrupt) when the bytes are not such a text.
    static VSDayRollup decoded(std::string_view bytes);

    friend bool operator==(const VSDayRollup&, const VSDayRollup&) = default;
};

/// The quarters of an encoded day without making them all: calls block(index, quarter) for each that holds
/// something, ascending. Throws as VSDayRollup::decoded.
template <typename Block>
void VSForEachRollupQuarter(std::string_view bytes, Block block);

/// The row of a day: type, source and day in one number, in this order.
int64_t VSRollupSlot(int type, int64_t source, int64_t day);
int64_t VSRollupDayOfSlot(int64_t slot);
int64_t VSRollupSourceOfSlot(int64_t slot);
int VSRollupTypeOfSlot(int64_t slot);

/// The rollups that a writing transaction changes, kept in memory until `flush`.
class VSRollupWriter {
 public:
    explicit VSRollupWriter(VSDatabase& database) : database_(database) {}
    /// Adds a sample to every day that it touches.
    void add(int type, int64_t source, int64_t start, int64_t duration, double value);
    /// Something was deleted from the days that this span touches: they are made anew from the samples at the
    /// flush.
    void rebuild(int type, int64_t source, int64_t start, int64_t duration);
    /// Writes everything down, before the commit.
    void flush(VSStoreProvenances& provenances);
    /// Forgets what was not flushed (a transaction that is rolled back).
    void clear();

 private:
    struct Entry {
        VSDayRollup rollup;
    };
    Entry& entry(int64_t slot);
    void write(int64_t slot, const VSDayRollup& rollup);
    void writeEntries();

    VSDatabase& database_;
    std::map<int64_t, std::unique_ptr<Entry>> entries_;
    int64_t lastSlot_ = 0;
    Entry* lastEntry_ = nullptr;
    std::set<int64_t> rebuild_;
};

/// The rollup of a day made anew from its samples: what `rollups` must hold, bit for bit.
VSDayRollup VSRollupFromSamples(VSDatabase& database, VSStoreProvenances& provenances, int type,
                                int64_t source, int64_t day);

[[noreturn]] void VSThrowCorruptRollup();

template <typename Block>
void VSForEachRollupQuarter(std::string_view bytes, Block block) {
    constexpr size_t bitmapSize = VSQuartersPerDay / 8;
    if (bytes.size() < bitmapSize) VSThrowCorruptRollup();
    const char* next = bytes.data() + bitmapSize;
    const char* end = bytes.data() + bytes.size();
    for (int index = 0; index < VSQuartersPerDay; ++index) {
        if (!(static_cast<unsigned char>(bytes[static_cast<size_t>(index / 8)]) >> (index % 8) & 1)) continue;
        if (end - next < static_cast<ptrdiff_t>(sizeof(VSRollupQuarter))) VSThrowCorruptRollup();
        VSRollupQuarter quarter;
        std::memcpy(&quarter, next, sizeof quarter);
        next += sizeof quarter;
        block(index, quarter);
    }
    if (next != end) VSThrowCorruptRollup();
}
