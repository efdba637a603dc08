#include <algorithm>

#include "Vessa/VSQueryAnswerer.h"
#include "Vessa/VSStatisticsEngine.h"

namespace {

/// Of a query that answers once: what its `read` gives goes to its handler.
template <typename Query, typename Handler, typename Read>
class Once final : public VSQueryAnswerer {
 public:
    Once(const Query& query, const Handler& handler, Read read)
        : query_(query), handler_(handler), read_(std::move(read)) {}
    Delivery answer(VSQueryLook& look) override {
        return VSDeliver(
            handler_, look.read(query_, [&](VSStoreReader& reader) { return read_(query_, reader, look); }));
    }

 private:
    const Query& query_;
    const Handler& handler_;
    const Read read_;
};

template <typename Query, typename Handler, typename Read>
std::unique_ptr<VSQueryAnswerer> once(const Query& query, const Handler& handler, Read read) {
    return std::make_unique<Once<Query, Handler, Read>>(query, handler, std::move(read));
}

class Observer final : public VSQueryAnswerer {
 public:
    explicit Observer(const VSObserverQuery& query) : query_(query) {}
    bool isLive() const override { return true; }
    Delivery answer(VSQueryLook& look) override {
        const auto result = look.read(query_, [](VSStoreReader&) { return true; });
        std::optional<VSError> error;
        if (!result) error = result.error();
        return VSDeliver(query_.updateHandler, error);
    }

 private:
    const VSObserverQuery& query_;
};

class Changes final : public VSQueryAnswerer {
 public:
    explicit Changes(const VSAnchoredObjectQuery& query) : query_(query), anchor_(query.anchor) {}
    bool isLive() const override { return static_cast<bool>(query_.updateHandler); }
    Delivery answer(VSQueryLook& look) override {
        int64_t last = 0;
        auto result = look.read(query_, [&](VSStoreReader& reader) {
            last = reader.lastNumber();
            return reader.changes(query_.type(), query_.predicate(), anchor_, query_.limit);
        });
        const bool first = std::exchange(first_, false);
        if (result) {
            anchor_ = result->anchor;
            if (anchor_.value < last) look.goOn();  // the limit was reached
            if (!first && result->added.empty() && result->deleted.empty()) return {};
        }
        return VSDeliver(first ? query_.initialResultsHandler : query_.updateHandler, std::move(result));
    }

 private:
    const VSAnchoredObjectQuery& query_;
    VSQueryAnchor anchor_;
    bool first_ = true;
};

class Collection final : public VSQueryAnswerer {
 public:
    explicit Collection(const VSStatisticsCollectionQuery& query) : query_(query) {}
    bool isLive() const override { return static_cast<bool>(query_.statisticsUpdateHandler); }
    Delivery answer(VSQueryLook& look) override {
        auto result =
            look.read(query_, [&](VSStoreReader& reader) -> std::shared_ptr<const VSStatisticsCollection> {
                auto buckets = VSStatisticsEngine(reader, query_.type(), query_.predicate(), query_.options)
                                   .buckets(query_.anchorDate, query_.interval, look.calendar());
                return std::make_shared<VSStatisticsCollection>(
                    query_.type(), query_.anchorDate, query_.interval, look.calendar(), std::move(buckets));
            });
        const bool first = std::exchange(first_, false);
        return VSDeliver(first ? query_.initialResultsHandler : query_.statisticsUpdateHandler,
                         std::move(result));
    }

 private:
    const VSStatisticsCollectionQuery& query_;
    bool first_ = true;
};

class DateRanges final : public VSQueryAnswerer {
 public:
    explicit DateRanges(const VSDateRangeQuery& query) : query_(query) {}
    bool isLive() const override { return true; }
    Delivery answer(VSQueryLook& look) override {
        return VSDeliver(query_.updateHandler, look.read(query_, [&](VSStoreReader& reader) {
            VSDateRangeQuery::Ranges ranges;
            for (const auto& [type, extent] : reader.extents()) {
                if (look.mayRead(reader, type))
                    ranges[type] = {VSDate::fromMicroseconds(extent.firstStart),
                                    VSDate::fromMicroseconds(extent.lastEnd)};
            }
            return ranges;
        }));
    }

 private:
    const VSDateRangeQuery& query_;
};

/// Whether a correlation has a member for each of the predicates.
bool hasMembers(const VSCorrelation& correlation,
                const std::map<const VSObjectType*, VSPredicate>& predicates) {
    return std::all_of(predicates.begin(), predicates.end(), [&](const auto& wanted) {
        const auto& members = correlation.objects();
        return !wanted.second.noCorrelation &&
               std::any_of(members.begin(), members.end(), [&](const VSSamplePtr& member) {
                   return member->sampleType() == wanted.first && wanted.second.matches(*member);
               });
    });
}

VSCorrelationQuery::Correlations correlations(const VSCorrelationQuery& query, VSStoreReader& reader) {
    if (query.type()->kind() != VSTypeKind::Correlation)
        throw VSDatabaseFailure(
            {VSErrorCode::Invalid, query.type()->identifier() + " is not a type of correlations"});
    VSCorrelationQuery::Correlations found;
    for (const VSSamplePtr& sample :
         reader.samples(query.type(), query.predicate(), VSObjectQueryNoLimit, {})) {
        auto correlation = std::dynamic_pointer_cast<const VSCorrelation>(sample);
        if (hasMembers(*correlation, query.samplePredicates)) found.push_back(std::move(correlation));
    }
    return found;
}

VSCountStatisticsQuery::Counts counts(const VSCountStatisticsQuery& query, VSStoreReader& reader,
                                      const VSCalendar& calendar) {
    VSCountStatisticsQuery::Counts counts;
    VSStatisticsEngine engine(reader, query.type(), query.predicate(), VSStatisticsOptionNone);
    for (const VSStatistics& bucket : engine.buckets(query.anchorDate, query.interval, calendar))
        counts[{bucket.startDate, bucket.endDate}] = bucket.count;
    return counts;
}

}  // namespace

VSQuery::~VSQuery() = default;

std::unique_ptr<VSQueryAnswerer> VSSampleQuery::answerer() const {
    return once(*this, handler, [](const VSSampleQuery& query, VSStoreReader& reader, VSQueryLook&) {
        return reader.samples(query.type(), query.predicate(), query.limit, query.sort);
    });
}

std::unique_ptr<VSQueryAnswerer> VSCorrelationQuery::answerer() const {
    return once(*this, completionHandler,
                [](const VSCorrelationQuery& query, VSStoreReader& reader, VSQueryLook&) {
                    return correlations(query, reader);
                });
}

std::unique_ptr<VSQueryAnswerer> VSObserverQuery::answerer() const {
    return std::make_unique<Observer>(*this);
}

std::unique_ptr<VSQueryAnswerer> VSAnchoredObjectQuery::answerer() const {
    return std::make_unique<Changes>(*this);
}

std::unique_ptr<VSQueryAnswerer> VSStatisticsQuery::answerer() const {
    return once(
        *this, completionHandler, [](const VSStatisticsQuery& query, VSStoreReader& reader, VSQueryLook&) {
            return VSStatisticsEngine(reader, query.type(), query.predicate(), query.options).statistics();
        });
}

std::unique_ptr<VSQueryAnswerer> VSStatisticsCollectionQuery::answerer() const {
    return std::make_unique<Collection>(*this);
}

std::unique_ptr<VSQueryAnswerer> VSCountStatisticsQuery::answerer() const {
    return once(*this, completionHandler,
                [](const VSCountStatisticsQuery& query, VSStoreReader& reader, VSQueryLook& look) {
                    return counts(query, reader, look.calendar());
                });
}

std::unique_ptr<VSQueryAnswerer> VSSourceQuery::answerer() const {
    return once(*this, completionHandler,
                [](const VSSourceQuery& query, VSStoreReader& reader, VSQueryLook&) {
                    return reader.sources(query.type(), query.predicate());
                });
}

std::unique_ptr<VSQueryAnswerer> VSDateRangeQuery::answerer() const {
    return std::make_unique<DateRanges>(*this);
}
