#pragma once

#include <map>
#include <vector>

#include "Vessa/VSSpanCover.h"
#include "Vessa/VSStatisticsExplanation.h"
#include "Vessa/VSStoreReader.h"

/// Takes the statistics of a range apart, sample by sample. It works from the samples alone, without the
/// rollups that the engine answers from. Made for one computation inside one read transaction. Throws
/// VSDatabaseFailure.
class VSStatisticsExplainer {
 public:
    VSStatisticsExplainer(VSStoreReader& reader, const VSObjectType* type, const VSPredicate& predicate);

    /// Ascending by start, then by number.
    std::vector<VSStatisticsExplanation::Contribution> contributions();

 private:
    /// A stretch of time, until the next one begins, and the sample to which it belongs of those that cover
    /// it: of the earliest source, then the one that starts first, then the one of the lowest number.
    struct Stretch {
        int64_t from;
        std::optional<size_t> owner;
    };
    void readSamples();
    void findOwners();
    void explain(size_t index, VSStatisticsExplanation::Contribution& contribution) const;
    std::vector<Stretch>::const_iterator stretchAt(int64_t moment) const;
    bool isTakenFrom(const Stretch& stretch, size_t index) const;

    VSStoreReader& reader_;
    const VSObjectType* const type_;
    const VSPredicate& predicate_;
    const int64_t from_, to_;  // the predicate's range
    // The matching samples, ascending by start and number.
    std::vector<VSSampleRow> rows_;
    std::vector<VSRankedSpan> spans_;
    std::vector<VSSamplePtr> samples_;
    std::vector<Stretch> stretches_;  // ascending
};
