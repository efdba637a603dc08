#pragma once

#include <algorithm>
#include <array>
#include <cstdint>
#include <map>
#include <memory>
#include <string>
#include <string_view>
#include <utility>

#include "Vessa/VSDatabase.h"
#include "Vessa/VSExactSum.h"

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

/// A bit for each quarter of a day, the first one lowest.
__extension__ using VSQuarterBits = unsigned __int128;
constexpr VSQuarterBits VSQuarterBit(int index) {
    return VSQuarterBits{1} << index;
}

/// What one quarter of an hour holds of one type and source.
struct VSRollupQuarter {
    uint32_t starting = 0;            // samples that start in it
    uint32_t touching = 0;            // samples that have a part of their span, or their moment, in it
    VSExactSum startingSum;           // of the values of those that start in it
    VSExactSum share;                 // of each span the part of its value that falls into it
    double minimum = 0, maximum = 0;  // of those that start in it; 0 when none does

    void appendTo(std::string& bytes) const;
    /// Reads what appendTo wrote. Throws VSDatabaseFailure (Corrupt).
    void readFrom(const char*& next, const char* end);
    friend bool operator==(const VSRollupQuarter&, const VSRollupQuarter&) = default;
};

/// The quarters of one day (UTC) of one type and source. What it holds does not depend on the order in which
/// samples are added.
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

/// Which quarters an encoded day holds. Throws VSDatabaseFailure (Corrupt).
VSQuarterBits VSQuartersPresent(std::string_view bytes);
void VSAppendQuarterBits(VSQuarterBits bits, std::string& bytes);

/// The parts of an encoded day without making it: calls block(index, part) for each quarter that holds
/// something, ascending. Throws VSDatabaseFailure (Corrupt).
template <typename Part, typename Block>
void VSForEachQuarter(std::string_view bytes, Block block);
template <typename Block>
void VSForEachRollupQuarter(std::string_view bytes, Block block) {
    VSForEachQuarter<VSRollupQuarter>(bytes, block);
}

/// The first and the last quarter that a span touches, counted from 1970.
struct VSQuarterRange {
    int64_t first, last;
};
VSQuarterRange VSQuartersOfSpan(int64_t start, int64_t duration);

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

    /// By type and day, the first and last quarter of the day of which the rollup of any source changed.
    struct Changed {
        int first = VSQuartersPerDay, last = -1;
        void include(int from, int to) {
            first = std::min(first, from);
            last = std::max(last, to);
        }
    };
    using Changes = std::map<std::pair<int, int64_t>, Changed>;
    /// Since the last call. REQUIRES: flushed.
    Changes takeChanges() { return std::exchange(changes_, {}); }

 private:
    struct Entry {
        VSDayRollup rollup;
        Changed changed;
    };
    /// A day of one source to make anew. In the order in which samples are read: a type's days, of all
    /// sources.
    struct Place {
        int type;
        int64_t day, source;
        auto operator<=>(const Place&) const = default;
    };
    using Places = std::map<Place, Changed>;

    Entry& entry(int64_t slot);
    void makeAnew(Places::const_iterator first, Places::const_iterator last, VSStoreProvenances& provenances);
    void write(int64_t slot, const VSDayRollup& rollup);
    void writeEntries();
    void note(int64_t slot, const Changed& changed);

    VSDatabase& database_;
    std::map<int64_t, std::unique_ptr<Entry>> entries_;
    int64_t lastSlot_ = 0;
    Entry* lastEntry_ = nullptr;
    Places rebuild_;
    Place recentPlace_{-1, 0, 0};
    Changed* recentRebuild_ = nullptr;
    Changes changes_;
};

/// Writes a row of `rollups`, or removes it when there are no bytes.
void VSWriteRollupRow(VSDatabase& database, int64_t slot, const std::string& bytes);

/// Makes all rollups, merged rows and noted orders of the store anew from its samples, in one pass, inside a
/// writing transaction. REQUIRES: `type_sources` and `source_order` are right. Throws VSDatabaseFailure.
void VSRebuildAllRollups(VSDatabase& database);

[[noreturn]] void VSThrowCorruptRollup();

template <typename Part, typename Block>
void VSForEachQuarter(std::string_view bytes, Block block) {
    const char* next = bytes.data() + VSQuartersPerDay / 8;
    const char* end = bytes.data() + bytes.size();
    const VSQuarterBits present = VSQuartersPresent(bytes);
    for (int index = 0; index < VSQuartersPerDay; ++index) {
        if (!(present & VSQuarterBit(index))) continue;
        Part part;
        part.readFrom(next, end);
        block(index, part);
    }
    if (next != end) VSThrowCorruptRollup();
}
