#pragma once

#include <atomic>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "Vessa/Base/VSError.h"
#include "Vessa/VSPredicate.h"
#include "Vessa/VSStatistics.h"

inline constexpr const char* VSSampleSortIdentifierStartDate = "startDate";
inline constexpr const char* VSSampleSortIdentifierEndDate = "endDate";
inline constexpr const char* VSObjectSortIdentifierDataID = "dataID";

struct VSSortDescriptor {
    std::string key;  // one of the identifiers above
    bool ascending = true;
};

inline constexpr int VSObjectQueryNoLimit = 0;

/// A question to the store: made, given its handlers, then executed once with VSHealthStore::executeQuery and
/// ended with stopQuery. Handlers are called on the store's threads, one call of one query at a time, never
/// from inside executeQuery, and none begins after stopQuery has returned (a call already running may
/// finish). The store holds an executing query; the handlers should hold their owners weakly.
class VSQuery {
 public:
    virtual ~VSQuery() = default;
    const VSObjectType* type() const { return type_; }
    const VSPredicate& predicate() const { return predicate_; }
    static VSPredicate predicateForSamples(std::optional<VSDate> start, std::optional<VSDate> end,
                                           int options) {
        return VSPredicate::samplesWithStartDate(start, end, options);
    }

 protected:
    VSQuery(const VSObjectType* type, VSPredicate predicate)
        : type_(type), predicate_(std::move(predicate)) {}

 private:
    const VSObjectType* type_;
    VSPredicate predicate_;
};

/// Samples of a type, once. Correlations come with their members.
class VSSampleQuery final : public VSQuery {
 public:
    using Handler = std::function<void(const VSResult<std::vector<VSSamplePtr>>&)>;
    VSSampleQuery(const VSObjectType* type, VSPredicate predicate, int resultLimit,
                  std::vector<VSSortDescriptor> order, Handler resultsHandler)
        : VSQuery(type, std::move(predicate)),
          limit(resultLimit),
          sort(std::move(order)),
          handler(std::move(resultsHandler)) {}
    const int limit;
    const std::vector<VSSortDescriptor> sort;  // none: in the order of insertion
    const Handler handler;
};

/// Fires once soon after the start, then after every change of samples of its type. It says only that there
/// was a change; several may be told at once.
class VSObserverQuery final : public VSQuery {
 public:
    using Handler = std::function<void(const std::optional<VSError>&)>;
    VSObserverQuery(const VSObjectType* type, VSPredicate predicate, Handler handler)
        : VSQuery(type, std::move(predicate)), updateHandler(std::move(handler)) {}
    const Handler updateHandler;
};

/// A place in the store's order of insertions and deletions; 0 is before everything.
struct VSQueryAnchor {
    int64_t value = 0;
    static VSQueryAnchor beyondAll() { return {INT64_MAX}; }
};

/// Samples added and objects deleted since an anchor, then (with an update handler) each later change.
/// An anchor beyond all objects means: from now.
class VSAnchoredObjectQuery final : public VSQuery {
 public:
    struct Answer {
        std::vector<VSSamplePtr> added;
        std::vector<VSDeletedObject> deleted;
        VSQueryAnchor anchor;
    };
    using Handler = std::function<void(const VSResult<Answer>&)>;
    VSAnchoredObjectQuery(const VSObjectType* type, VSPredicate predicate, VSQueryAnchor since,
                          int resultLimit, Handler handler)
        : VSQuery(type, std::move(predicate)),
          anchor(since),
          limit(resultLimit),
          initialResultsHandler(std::move(handler)) {}
    const VSQueryAnchor anchor;
    const int limit;
    const Handler initialResultsHandler;
    Handler updateHandler;  // set before execution; empty: the query ends with its first answer
};

class VSStatisticsQuery final : public VSQuery {
 public:
    using Handler = std::function<void(const VSResult<VSStatistics>&)>;
    VSStatisticsQuery(const VSObjectType* type, VSPredicate predicate, int statisticsOptions, Handler handler)
        : VSQuery(type, std::move(predicate)),
          options(statisticsOptions),
          completionHandler(std::move(handler)) {}
    const int options;
    const Handler completionHandler;
};

/// Statistics per calendar bucket, once or (with an update handler) again after every change.
class VSStatisticsCollectionQuery final : public VSQuery {
 public:
    using Handler = std::function<void(const VSResult<std::shared_ptr<const VSStatisticsCollection>>&)>;
    VSStatisticsCollectionQuery(const VSObjectType* type, VSPredicate predicate, int statisticsOptions,
                                VSDate anchor, VSDateComponents bucket)
        : VSQuery(type, std::move(predicate)),
          options(statisticsOptions),
          anchorDate(anchor),
          interval(bucket) {}
    const int options;
    const VSDate anchorDate;
    const VSDateComponents interval;
    Handler initialResultsHandler;
    Handler statisticsUpdateHandler;
};

/// The sources that have samples of a type.
class VSSourceQuery final : public VSQuery {
 public:
    using Handler = std::function<void(const VSResult<std::vector<VSSource>>&)>;
    VSSourceQuery(const VSObjectType* type, VSPredicate predicate, Handler handler)
        : VSQuery(type, std::move(predicate)), completionHandler(std::move(handler)) {}
    const Handler completionHandler;
};
