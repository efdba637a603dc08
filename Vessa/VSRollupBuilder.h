#pragma once

#include <functional>
#include <map>
#include <string>
#include <vector>

#include "Vessa/VSMergedRollup.h"

/// Makes the rows that `rollups` must hold from the samples alone, bit for bit, in one pass over them in the
/// order of the table. REQUIRES: `type_sources` and `source_order` are right. Throws VSDatabaseFailure.
class VSRollupBuilder {
 public:
    /// Is given each row, by type and day.
    using Row = std::function<void(int64_t slot, const std::string& bytes)>;
    VSRollupBuilder(VSDatabase& database, VSStoreProvenances& provenances, Row row)
        : database_(database), provenances_(provenances), row_(std::move(row)) {}

    /// Every sample, by type and start.
    void add(int type, int64_t start, int64_t duration, double value, int64_t provenance);
    void finish();
    /// The order of sources by which the merged rows of each type that has them were made.
    const std::map<int, std::vector<int64_t>>& orders() const { return orders_; }

 private:
    void beginType(int type);
    void endType();
    void endDaysBefore(int64_t day);
    void endMergedDay();

    VSDatabase& database_;
    VSStoreProvenances& provenances_;
    const Row row_;
    std::map<int, std::vector<int64_t>> orders_;
    int type_ = -1;
    std::map<std::pair<int64_t, int64_t>, VSDayRollup> days_;  // by day and source
    std::optional<VSMergedSweep> sweep_;                       // of a type whose sources may meet
    std::map<int64_t, size_t> ranks_;
    std::optional<int64_t> mergedDay_;
    VSMergedDay merged_;
};
