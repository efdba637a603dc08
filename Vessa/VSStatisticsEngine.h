#pragma once

#include <optional>
#include <vector>

#include "Vessa/Base/VSCalendar.h"
#include "Vessa/VSMergedRollup.h"
#include "Vessa/VSStatistics.h"
#include "Vessa/VSStoreReader.h"

/// Computes statistics of one type from the rollups, and from the samples where those do not reach: at
/// borders inside of a quarter, under conditions other than a range of dates, and where several sources of a
/// cumulative type meet. Made for one computation inside one read transaction. Throws VSDatabaseFailure.
///
/// Sum of a cumulative type: a sample counts over those parts of its span that no sample of a source earlier
/// in the order of sources covers. A span covers its moments from its start up to, not including, its end; a
/// sample without length covers nothing, and counts whole unless its moment is covered.
class VSStatisticsEngine {
 public:
    VSStatisticsEngine(VSStoreReader& reader, const VSObjectType* type, const VSPredicate& predicate,
                       int options);

    VSStatistics statistics();
    /// The buckets with data, ascending. Invalid: the interval is not positive.
    std::vector<VSStatistics> buckets(VSDate anchor, const VSDateComponents& interval,
                                      const VSCalendar& calendar);

 private:
    /// What a bucket gathers, in all or of one source.
    struct Gathered {
        int64_t count = 0;
        VSExactSum startingSum;
        double minimum = 0, maximum = 0;
        bool touched = false;  // there is a sum
        VSExactSum sum;
        void addStarting(int64_t samples, const VSExactSum& total, double low, double high);
        void addShare(const VSExactSum& share);
    };
    struct Segment {
        int64_t from, to;
        bool rolledUp;
    };  // [from, to) in microseconds
    enum Parts { Starting = 1, Own = 2, Merged = 4, All = 7 };
    class RollupCursor;

    bool findRange();
    VSStoreReader::Extent extentOfSources() const;
    void gather(std::vector<int64_t> borders);
    std::vector<Segment> segments() const;
    static std::vector<Segment> united(std::vector<Segment> segments);
    void gatherRollups(const Segment& segment);
    void gatherDay(int64_t day, const std::vector<RollupCursor*>& cursors, const RollupCursor& merged,
                   const Segment& segment, std::vector<Segment>& conflicts);
    VSQuarterBits gatherMergedDay(int64_t dayStart, VSQuarterBits wanted, const RollupCursor& merged);
    void gatherLongSpans(const Segment& segment, std::vector<Segment>& conflicts);
    void gatherSamples(const Segment& segment, int parts);
    void addStarting(const VSSampleRow& row, size_t rank);
    /// Spreads the part [from, to) of a span over the buckets.
    void addShare(const VSRankedSpan& span, int64_t from, int64_t to, int parts);
    size_t bucketOf(int64_t moment);
    size_t rankOf(int64_t provenance);
    bool isLongConflict(int64_t moment) const;
    VSStatistics finished(size_t bucket) const;

    VSStoreReader& reader_;
    const VSObjectType* const type_;
    const VSPredicate predicate_;
    const int options_;
    const bool separate_, fromRollups_;
    bool merging_ = false;            // several sources of a cumulative type, and a sum is asked for
    std::vector<int64_t> sources_;    // by rank: the order in which they count
    int64_t from_ = 0, to_ = 0;       // the part of the predicate's range that can hold data
    std::vector<int64_t> borders_;    // of the buckets, one more than those
    std::vector<Gathered> gathered_;  // by bucket
    std::vector<std::vector<Gathered>> ofSource_;  // by bucket and rank, when separate_
    std::vector<Segment> longConflicts_;           // in the current segment, quarters that long spans meet
    size_t recentBucket_ = 0;
};
