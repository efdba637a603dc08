#include "Vessa/VSHealthStoreConnection.h"

#include "Vessa/VSStatisticsEngine.h"
#include "Vessa/VSStatisticsExplainer.h"

VSResult<VSStatistics> VSHealthStoreConnection::statistics(const VSObjectType* type,
                                                           const VSPredicate& predicate, int options) {
    return readOf(type, predicate, [&](VSStoreReader& reader) {
        return VSStatisticsEngine(reader, type, predicate, options).statistics();
    });
}

VSResult<std::shared_ptr<const VSStatisticsCollection>> VSHealthStoreConnection::statisticsCollection(
    const VSObjectType* type, const VSPredicate& predicate, int options, VSDate anchor,
    const VSDateComponents& interval) {
    return readOf(
        type, predicate, [&](VSStoreReader& reader) -> std::shared_ptr<const VSStatisticsCollection> {
            const VSCalendar calendar = VSCalendar::current();
            return std::make_shared<VSStatisticsCollection>(
                type, anchor, interval, calendar,
                VSStatisticsEngine(reader, type, predicate, options).buckets(anchor, interval, calendar));
        });
}

VSResult<VSStatisticsExplanation> VSHealthStoreConnection::explainStatistics(const VSObjectType* type,
                                                                             const VSPredicate& predicate,
                                                                             int options) {
    return readOf(type, predicate, [&](VSStoreReader& reader) {
        const int separately = options | VSStatisticsOptionSeparateBySource;
        return VSStatisticsExplanation{VSStatisticsEngine(reader, type, predicate, separately).statistics(),
                                       VSStatisticsExplainer(reader, type, predicate).contributions()};
    });
}
