#pragma once

#include <functional>
#include <map>
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

/// From its start up to its end.
struct VSDateInterval {
    VSDate start, end;
    friend auto operator<=>(const VSDateInterval&, const VSDateInterval&) = default;
};

class VSQueryAnswerer;

/// A question to the store: made, given its handlers, then executed once with VSHealthStore::executeQuery and
/// ended with stopQuery. For every kind:
///
/// - Owner: the store holds an executing query; the handlers should hold their owners weakly. A query without
///   an update handler ends by itself with its first answer; a live one goes on until it is stopped or the
///   store ends. What a handler is given is its own to keep, also after the store has ended.
/// - Thread: handlers are called on the store's threads, one call of one query at a time, never from inside
///   executeQuery, and none begins after stopQuery has returned (a call already running may finish).
/// - What an answer shows is one state of the store: all of a save or nothing of it. Saves whose completion
///   was called before executeQuery are in it. Changes that come quickly may share one answer.
/// - Errors: the answer is an error where the store could not be read (NotAccessible: it is locked;
///   Corrupt, Failed), where the question makes no sense (Invalid), and where the connection's application
///   may not read the type (Refused). A live query that failed stays, and answers again after the next
///   change, not before.
/// - Units: quantities of samples and statistics are in the canonical unit of their type.
class VSQuery {
 public:
    virtual ~VSQuery();
    /// Null: it asks about all types.
    const VSObjectType* type() const { return type_; }
    const VSPredicate& predicate() const { return predicate_; }
    static VSPredicate predicateForSamples(std::optional<VSDate> start, std::optional<VSDate> end,
                                           int options) {
        return VSPredicate::samplesWithStartDate(start, end, options);
    }
    /// For the store: what answers it. The query outlives it.
    virtual std::unique_ptr<VSQueryAnswerer> answerer() const = 0;

 protected:
    VSQuery(const VSObjectType* type, VSPredicate predicate)
        : type_(type), predicate_(std::move(predicate)) {}

 private:
    const VSObjectType* const type_;
    const VSPredicate predicate_;
};

/// Samples of a type, once. Correlations come with their members.
class VSSampleQuery final : public VSQuery {
 public:
    using Handler = std::function<void(const VSResult<std::vector<VSSamplePtr>>&)>;
    /// In the order of the sort descriptors, the first of which weighs most; samples that are equal in all of
    /// them stand in the order of insertion, in the direction of the first. Without any: in the order of
    /// insertion. The limit keeps the first of that order. Invalid: an unknown key.
    VSSampleQuery(const VSObjectType* type, VSPredicate predicate, int resultLimit,
                  std::vector<VSSortDescriptor> order, Handler resultsHandler)
        : VSQuery(type, std::move(predicate)),
          limit(resultLimit),
          sort(std::move(order)),
          handler(std::move(resultsHandler)) {}
    std::unique_ptr<VSQueryAnswerer> answerer() const override;
    const int limit;
    const std::vector<VSSortDescriptor> sort;
    const Handler handler;
};

/// Correlations with their members, once, in the order of insertion.
class VSCorrelationQuery final : public VSQuery {
 public:
    using Correlations = std::vector<std::shared_ptr<const VSCorrelation>>;
    using Handler = std::function<void(const VSResult<Correlations>&)>;
    /// For each type in `ofMembers` a correlation has at least one member of that type that its predicate
    /// matches (`noCorrelation` matches no member). Invalid: not a correlation type.
    VSCorrelationQuery(const VSObjectType* type, VSPredicate predicate,
                       std::map<const VSObjectType*, VSPredicate> ofMembers, Handler handler)
        : VSQuery(type, std::move(predicate)),
          samplePredicates(std::move(ofMembers)),
          completionHandler(std::move(handler)) {}
    std::unique_ptr<VSQueryAnswerer> answerer() const override;
    const std::map<const VSObjectType*, VSPredicate> samplePredicates;
    const Handler completionHandler;
};

/// Live: fires once soon after the start, then after every change of its type (samples, deletions, the order
/// of sources, permissions, a characteristic's value), whatever the predicate. It says only that there was a
/// change; several may be told at once.
class VSObserverQuery final : public VSQuery {
 public:
    using Handler = std::function<void(const std::optional<VSError>&)>;
    VSObserverQuery(const VSObjectType* type, VSPredicate predicate, Handler handler)
        : VSQuery(type, std::move(predicate)), updateHandler(std::move(handler)) {}
    std::unique_ptr<VSQueryAnswerer> answerer() const override;
    const Handler updateHandler;
};

/// A place in the store's order of insertions and deletions; 0 is before everything. May be kept, also over
/// restarts of the program.
struct VSQueryAnchor {
    int64_t value = 0;
    static VSQueryAnchor beyondAll() { return {INT64_MAX}; }
};

/// Samples added and objects deleted since an anchor, then (with an update handler) each later change.
/// An anchor beyond all objects means: from now. Who goes on from the anchor of the last answer misses
/// nothing and is told nothing twice, with or without a limit.
///
/// Of deleted objects nothing but their number is left: a deletion may be told of an object that was not,
/// since it did not match the predicate or went before its page came. Without a limit, objects that came and
/// went between two answers are not told at all. A member that became loose by the deletion of its
/// correlation is not new.
class VSAnchoredObjectQuery final : public VSQuery {
 public:
    struct Answer {
        std::vector<VSSamplePtr> added;        // in the order of insertion
        std::vector<VSDeletedObject> deleted;  // in the order of deletion
        VSQueryAnchor anchor;
    };
    using Handler = std::function<void(const VSResult<Answer>&)>;
    /// The limit is one of added samples per answer; a live query then goes on with the next ones at once.
    VSAnchoredObjectQuery(const VSObjectType* type, VSPredicate predicate, VSQueryAnchor since,
                          int resultLimit, Handler handler)
        : VSQuery(type, std::move(predicate)),
          anchor(since),
          limit(resultLimit),
          initialResultsHandler(std::move(handler)) {}
    std::unique_ptr<VSQueryAnswerer> answerer() const override;
    const VSQueryAnchor anchor;
    const int limit;
    const Handler initialResultsHandler;
    /// Set before execution; empty: the query ends with its first answer. Not called where nothing was added
    /// or deleted.
    Handler updateHandler;
};

/// Statistics of one range, once. Types other than quantity types have counts only.
class VSStatisticsQuery final : public VSQuery {
 public:
    using Handler = std::function<void(const VSResult<VSStatistics>&)>;
    VSStatisticsQuery(const VSObjectType* type, VSPredicate predicate, int statisticsOptions, Handler handler)
        : VSQuery(type, std::move(predicate)),
          options(statisticsOptions),
          completionHandler(std::move(handler)) {}
    std::unique_ptr<VSQueryAnswerer> answerer() const override;
    const int options;  // VSStatisticsOptions
    const Handler completionHandler;
};

/// Statistics per calendar bucket, once or (with an update handler) again after every change of its type.
/// Types other than quantity types have counts only: their buckets are those in which samples start.
///
/// The buckets follow the calendar that was in force at executeQuery, for all of the query's life: after a
/// change of the time zone its owner makes a new query, as on a new day, so that no chart shows buckets of
/// two zones.
class VSStatisticsCollectionQuery final : public VSQuery {
 public:
    using Handler = std::function<void(const VSResult<std::shared_ptr<const VSStatisticsCollection>>&)>;
    /// Invalid: the interval is not positive.
    VSStatisticsCollectionQuery(const VSObjectType* type, VSPredicate predicate, int statisticsOptions,
                                VSDate anchor, VSDateComponents bucket)
        : VSQuery(type, std::move(predicate)),
          options(statisticsOptions),
          anchorDate(anchor),
          interval(bucket) {}
    std::unique_ptr<VSQueryAnswerer> answerer() const override;
    const int options;  // VSStatisticsOptions
    const VSDate anchorDate;
    const VSDateComponents interval;
    // Set before execution:
    Handler initialResultsHandler;
    Handler statisticsUpdateHandler;
};

/// How many samples start in each bucket of a range, once. Any type.
class VSCountStatisticsQuery final : public VSQuery {
 public:
    /// By bucket, and only buckets in which samples start. The last one may reach beyond the end of the
    /// range; what starts there does not count.
    using Counts = std::map<VSDateInterval, int64_t>;
    using Handler = std::function<void(const VSResult<Counts>&)>;
    /// Buckets are counted from the start of [start, end), in the calendar in force at executeQuery. Invalid:
    /// the interval is not positive.
    VSCountStatisticsQuery(const VSObjectType* type, VSDate start, VSDate end, VSDateComponents bucket,
                           const VSPredicate& predicate, Handler handler)
        : VSQuery(type, predicate & VSPredicate::samplesWithStartDate(start, end, VSQueryOptionNone)),
          anchorDate(start),
          interval(bucket),
          completionHandler(std::move(handler)) {}
    std::unique_ptr<VSQueryAnswerer> answerer() const override;
    const VSDate anchorDate;
    const VSDateComponents interval;
    const Handler completionHandler;
};

/// The sources that have samples of a type that match the predicate, once, in the order in which they count.
class VSSourceQuery final : public VSQuery {
 public:
    using Handler = std::function<void(const VSResult<std::vector<VSSource>>&)>;
    VSSourceQuery(const VSObjectType* type, VSPredicate predicate, Handler handler)
        : VSQuery(type, std::move(predicate)), completionHandler(std::move(handler)) {}
    std::unique_ptr<VSQueryAnswerer> answerer() const override;
    const Handler completionHandler;
};

/// Live: the first start and the last end of the samples of each type that has any, soon after the start and
/// again after every change of any type, also where no range became another. Types that the application may
/// not read are left out.
class VSDateRangeQuery final : public VSQuery {
 public:
    using Ranges = std::map<const VSObjectType*, VSDateInterval>;
    using Handler = std::function<void(const VSResult<Ranges>&)>;
    explicit VSDateRangeQuery(Handler handler) : VSQuery(nullptr, {}), updateHandler(std::move(handler)) {}
    std::unique_ptr<VSQueryAnswerer> answerer() const override;
    const Handler updateHandler;
};
