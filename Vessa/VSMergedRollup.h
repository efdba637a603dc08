#pragma once

#include <functional>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "Vessa/VSRollup.h"
#include "Vessa/VSSpanCover.h"

class VSStoreProvenances;

/// The numbers of the sources of a type that have samples, in the order in which they count: the user's; else
/// the application's own first, then by the start of the first sample.
std::vector<int64_t> VSOrderedSources(VSDatabase& database, VSStoreProvenances& provenances, int type);

/// Whether the type's sums count no moment from two sources, so that it has merged rows.
bool VSTypeIsMerged(int type);

/// The order of sources with which the merged rows of a type were made.
std::vector<int64_t> VSOrderOfMergedRows(VSDatabase& database, int type);
void VSNoteOrderOfMergedRows(VSDatabase& database, int type, const std::vector<int64_t>& order);
/// Whether the sources that both have stand in the same order.
bool VSOrdersAgree(const std::vector<int64_t>& a, const std::vector<int64_t>& b);

/// The number under which `rollups` keeps what is merged over the sources.
inline constexpr int64_t VSMergedSource = 0;

/// What the samples of all sources count together in one quarter.
struct VSMergedQuarter {
    VSExactSum share;
    void readFrom(const char*& next, const char* end);
};

/// The quarters of one day (UTC) of a type that at least two sources touch, with what is counted in each.
class VSMergedDay {
 public:
    void set(int index, const VSExactSum& share);
    void clear(int from, int to);  // both included
    /// A bit per quarter (12 bytes), then the shares; nothing when no quarter is there.
    std::string encoded() const;
    /// Throws VSDatabaseFailure (Corrupt).
    static VSMergedDay decoded(std::string_view bytes);

 private:
    VSQuarterBits present_ = 0;
    std::array<VSExactSum, VSQuartersPerDay> shares_;
};

/// Makes merged quarters from the samples of a type, which come in ascending order of their starts.
class VSMergedSweep {
 public:
    /// Calls block(quarter, share) for each quarter (counted from 1970) that two sources or more touch,
    /// ascending.
    using Block = std::function<void(int64_t quarter, const VSExactSum& share)>;
    explicit VSMergedSweep(Block block) : block_(std::move(block)) {}
    /// Spans over 48 hours leave nothing.
    void add(const VSRankedSpan& span);
    void finish() { advance(INT64_MAX); }

 private:
    void advance(int64_t quarter);
    void merge();

    const Block block_;
    int64_t quarter_ = INT64_MIN;       // the one that is being gathered
    std::vector<VSRankedSpan> active_;  // the spans that touch it
    std::vector<VSRankedSpan> sorted_;
};

/// Keeps the merged rows in step with the samples, inside a writing transaction.
class VSMergedRollups {
 public:
    VSMergedRollups(VSDatabase& database, VSStoreProvenances& provenances)
        : database_(database), provenances_(provenances) {}
    /// Samples of the type or the order of its sources may have changed. `changes`: of this type, by day.
    /// REQUIRES: rollups and `type_sources` are written.
    void update(int type, const std::map<int64_t, VSRollupWriter::Changed>& changes);

 private:
    struct Day {
        int64_t day;
        int first, last;  // the quarters to make anew
    };
    bool sourcesMeet(const Day& day);
    void remake(const std::vector<Day>& days);
    void sweep(int64_t from, int64_t to, VSMergedSweep& sweep);
    void remakeAll();

    VSDatabase& database_;
    VSStoreProvenances& provenances_;
    int type_ = 0;
    std::vector<int64_t> order_;
};
