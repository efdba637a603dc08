#pragma once

#include <optional>
#include <vector>

#include "Vessa/Base/VSCalendar.h"
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
    /// The buckets with data, ascending.
    std::vector<VSStatistics> buckets(VSDate anchor, const VSDateComponents& interval,
                                      const VSCalendar& calendar);

 private:
    /// What a bucket gathers, in all or of one source.
    struct Gathered {
        int64_t count = 0;
        double startingSum = 0, minimum = 0, maximum = 0;
        bool touched = false;  // there is a sum
        double sum = 0;
        void addStarting(int64_t samples, double total, double low, double high);
        void addShare(double share);
    };
    struct Segment {
        int64_t from, to;
        bool rolledUp;
    };  // [from, to) in microseconds
    struct RankedRow {
        size_t rank;
        VSSampleRow row;
    };
    enum Parts { Starting = 1, Own = 2, Merged = 4, All = 7 };
    class RollupCursor;
    class Cover;

    bool findRange();
    void gather(std::vector<int64_t> borders);
    std::vector<Segment> segments() const;
    void gatherRollups(const Segment& segment);
    void gatherDay(int64_t day, std::vector<RollupCursor*>& cursors, const Segment& segment,
                   std::vector<Segment>& conflicts);
    void gatherLongSpans(const Segment& segment, std::vector<Segment>& conflicts);
    void gatherSamples(const Segment& segment, int parts);
    void gatherMerged(const std::vector<RankedRow>& rows, const Segment& segment);
    void addStarting(int64_t moment, size_t rank, int64_t count, double sum, double low, double high);
    /// Spreads the part [from, to) of a span of this duration and value over the buckets.
    void addShare(int64_t from, int64_t to, int64_t duration, double value, size_t rank, int parts);
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
