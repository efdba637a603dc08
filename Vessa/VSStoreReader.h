#pragma once

#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <unordered_map>
#include <vector>

#include "Vessa/VSHealthStore.h"
#include "Vessa/VSQuery.h"
#include "Vessa/VSSampleRow.h"
#include "Vessa/VSStoreMatcher.h"
#include "Vessa/VSStoreProvenances.h"

/// The date part of a predicate in microseconds.
class VSDateFilter {
 public:
    explicit VSDateFilter(const VSPredicate& predicate);
    bool matches(int64_t start, int64_t duration) const {
        return start >= startsFrom_ && start < startsBefore_ && start + duration <= endsBy_ &&
               (start + duration > start_ || (duration == 0 && start >= start_));
    }
    /// Samples that start earlier match only by a span that reaches so far.
    int64_t start() const { return start_; }
    /// No sample that starts before this matches.
    int64_t startsFrom() const { return startsFrom_; }
    /// No sample that starts here or later matches.
    int64_t startsBefore() const { return startsBefore_; }

 private:
    int64_t start_ = INT64_MIN, startsFrom_ = INT64_MIN, startsBefore_ = INT64_MAX, endsBy_ = INT64_MAX;
};

/// Answers from one connection. Every public operation is one snapshot when called inside a read transaction.
/// Used by one thread at a time. Throws VSDatabaseFailure.
class VSStoreReader {
 public:
    explicit VSStoreReader(VSDatabase& database);

    std::vector<VSSamplePtr> samples(const VSObjectType* type, const VSPredicate& predicate, int limit,
                                     const std::vector<VSSortDescriptor>& sort);
    VSAnchoredObjectQuery::Answer changes(const VSObjectType* type, const VSPredicate& predicate,
                                          VSQueryAnchor anchor, int limit);
    std::vector<VSSource> sources(const VSObjectType* type, const VSPredicate& predicate);
    /// The numbers of the sources of a type, in the order in which they count.
    std::vector<int64_t> orderedSources(const VSObjectType* type);

    struct Extent {
        int64_t count = 0, firstStart = INT64_MAX, lastEnd = INT64_MIN;
    };
    /// Of one source of a type; a count of 0: it has none.
    Extent extent(const VSObjectType* type, int64_t source);
    Extent extent(const VSObjectType* type);
    /// Of each type that has samples.
    std::map<const VSObjectType*, Extent> extents();

    /// Calls block(row) for every sample that matches, in ascending or descending order of its start (and
    /// number), until it returns false.
    void scan(const VSObjectType* type, const VSPredicate& predicate, bool ascending,
              const std::function<bool(const VSSampleRow&)>& block);
    VSSamplePtr object(const VSObjectType* type, const VSSampleRow& row);
    int64_t longest(const VSObjectType* type);
    /// The number of the last change of each type.
    std::map<int, int64_t> typeChanges();
    int64_t lastChange(const VSObjectType* type);
    /// The default values of an application by key, serialized.
    std::map<std::string, std::string> defaultTexts(const std::string& application);
    int64_t lastNumber() { return database_.integer("SELECT last FROM state"); }

    VSDatabase& database() { return database_; }
    VSStoreProvenances& provenances() { return provenances_; }

 private:
    /// All but the dates of a predicate, answered once per provenance and metadata.
    class Conditions;
    template <typename Accept>
    bool scanRows(VSStatement& rows, Accept accept);
    std::vector<VSSampleRow> firstRows(const VSObjectType* type, const VSPredicate& predicate, int limit,
                                       const VSSortDescriptor& key);
    std::vector<VSSampleRow> rowsByNumber(const VSObjectType* type, const VSPredicate& predicate, int limit,
                                          bool ascending);

    VSDatabase& database_;
    VSStoreProvenances provenances_;
    VSStoreMetadata metadata_;
    VSStoreMatcher matcher_;
};
